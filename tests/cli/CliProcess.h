#ifndef TESTS_CLI_CLIPROCESS_H
#define TESTS_CLI_CLIPROCESS_H

// Runs the built ssoclient tool as a child process with given standard input, collecting its
// exit code, standard output and standard error; files for its arguments.

#include <gtest/gtest.h>
#include <unistd.h>

#include <fstream>
#include <string>
#include <vector>

#include "support/ChildProcess.h"

namespace CliTest {

using CliResult = TestSupport::ProcessResult;

inline CliResult RunCli(const std::vector<std::string>& arguments, const std::string& input = "") {
  return TestSupport::RunProgram(SSOCLIENT_BINARY_DIR "/tools/cli/ssoclient", arguments, input);
}

// A path for a file of this test process below the test's temporary directory.
inline std::string TempPath(const std::string& name) {
  return ::testing::TempDir() + "/ssoclient-cli-" + std::to_string(getpid()) + "-" + name;
}

inline void WriteFile(const std::string& path, const std::string& text) {
  std::ofstream(path, std::ios::binary) << text;
}

// The lines of `text`.
inline std::vector<std::string> Lines(const std::string& text) {
  std::vector<std::string> lines;
  size_t start = 0;
  while (start < text.size()) {
    size_t end = text.find('\n', start);
    if (end == std::string::npos) end = text.size();
    lines.push_back(text.substr(start, end - start));
    start = end + 1;
  }
  return lines;
}

}  // namespace CliTest

#endif
