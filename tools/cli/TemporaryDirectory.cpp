#include "TemporaryDirectory.h"

#include <stdlib.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <system_error>
#include <vector>

#include "ExitCodes.h"

namespace Cli {

TemporaryDirectory::TemporaryDirectory(const std::string& prefix) {
  std::string pattern = (std::filesystem::temp_directory_path() / (prefix + "XXXXXX")).string();
  std::vector<char> buffer(pattern.begin(), pattern.end());
  buffer.push_back('\0');
  if (mkdtemp(buffer.data()) == nullptr) {
    throw CliError("FileError", EXIT_CODE_OTHER,
                   "expected to create a directory like '" + pattern + "', failed: " + std::strerror(errno));
  }
  _path = buffer.data();
}

TemporaryDirectory::~TemporaryDirectory() {
  std::error_code ignored;
  std::filesystem::remove_all(_path, ignored);
}

std::string TemporaryDirectory::File(const std::string& name) const { return _path + "/" + name; }

}  // namespace Cli
