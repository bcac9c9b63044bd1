#ifndef TOOLS_CLI_TEMPORARYDIRECTORY_H
#define TOOLS_CLI_TEMPORARYDIRECTORY_H

#include <string>

namespace Cli {

// A fresh private directory below the system's temporary directory, removed with all its
// content on destruction.
class TemporaryDirectory {
 public:
  explicit TemporaryDirectory(const std::string& prefix);
  ~TemporaryDirectory();
  TemporaryDirectory(const TemporaryDirectory&) = delete;
  TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;

  const std::string& GetPath() const { return _path; }
  // GetPath() + "/" + name.
  std::string File(const std::string& name) const;

 private:
  std::string _path;
};

}  // namespace Cli

#endif
