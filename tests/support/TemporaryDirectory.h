#ifndef TESTS_SUPPORT_TEMPORARYDIRECTORY_H
#define TESTS_SUPPORT_TEMPORARYDIRECTORY_H

// A fresh directory under /tmp, removed with all its content when the object goes.

#include <stdlib.h>

#include <filesystem>
#include <stdexcept>
#include <string>

namespace TestSupport {

class TemporaryDirectory {
 public:
  TemporaryDirectory() {
    char pattern[] = "/tmp/ssoclient-test-XXXXXX";
    if (mkdtemp(pattern) == nullptr) throw std::runtime_error("cannot create a temporary directory");
    _path = pattern;
  }
  ~TemporaryDirectory() { std::filesystem::remove_all(_path); }
  TemporaryDirectory(const TemporaryDirectory&) = delete;
  TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;

  const std::string& GetPath() const { return _path; }

 private:
  std::string _path;
};

}  // namespace TestSupport

#endif
