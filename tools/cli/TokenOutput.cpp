#include "TokenOutput.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "ExitCodes.h"
#include "TokenFacts.h"

namespace Cli {
namespace {

CliError WriteError(const std::string& path, const std::string& reason) {
  return CliError("FileError", EXIT_CODE_OTHER, "file '" + path + "': cannot be written: " + reason);
}

// A token is a credential: the file is created for its owner alone.
void WriteSecretFile(const std::string& path, const std::string& text) {
  const int fd = open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
  if (fd < 0) throw WriteError(path, std::strerror(errno));
  size_t written = 0;
  while (written < text.size()) {
    const ssize_t count = write(fd, text.data() + written, text.size() - written);
    if (count < 0 && errno == EINTR) continue;
    if (count <= 0) {
      const std::string reason = std::strerror(errno);
      close(fd);
      throw WriteError(path, reason);
    }
    written += static_cast<size_t>(count);
  }
  if (close(fd) != 0) throw WriteError(path, std::strerror(errno));
}

}  // namespace

void WriteTokenResult(const SsoClient::SamlToken& token, const CommonOptions& options, std::ostream& out) {
  if (!options.outFile.empty()) {
    WriteSecretFile(options.outFile, token.ToXml());
    if (options.json) {
      out << TokenFactsJson(token).dump(2) << "\n";
    } else {
      out << "token written to " << options.outFile << "\n";
      WriteTokenFacts(out, token);
    }
  } else if (options.json) {
    nlohmann::json result = TokenFactsJson(token);
    result["xml"] = token.ToXml();
    out << result.dump(2) << "\n";
  } else {
    out << token.ToXml() << "\n";
  }
  out.flush();
}

}  // namespace Cli
