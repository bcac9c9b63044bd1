#ifndef TESTS_SUPPORT_CHILDPROCESS_H
#define TESTS_SUPPORT_CHILDPROCESS_H

// Runs a built program as a child process with given standard input, and collects its exit
// code, standard output and standard error.

#include <chrono>
#include <string>
#include <vector>

namespace TestSupport {

struct ProcessResult {
  int exitCode = -1;
  std::string out;
  std::string err;
};

// Runs the program at `path` with `arguments` (no shell in between). A run that has not ended
// after `limit` is killed and reported with exit code -1; the limit only guards against a hung
// test, it is far above any expected run time. A program that cannot be started exits with 127.
ProcessResult RunProgram(const std::string& path, const std::vector<std::string>& arguments,
                         const std::string& input = "", std::chrono::seconds limit = std::chrono::seconds(600));

}  // namespace TestSupport

#endif
