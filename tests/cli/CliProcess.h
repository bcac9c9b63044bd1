#ifndef TESTS_CLI_CLIPROCESS_H
#define TESTS_CLI_CLIPROCESS_H

// Runs the built ssoclient tool as a child process with given standard input, and collects its
// exit code, standard output and standard error; files for its arguments.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

namespace CliTest {

struct CliResult {
  int exitCode = -1;
  std::string out;
  std::string err;
};

inline std::string CliBinary() { return SSOCLIENT_BINARY_DIR "/tools/cli/ssoclient"; }

namespace Detail {

struct Pipe {
  int read = -1;
  int write = -1;
  Pipe() {
    int fds[2];
    if (pipe2(fds, O_CLOEXEC) != 0) throw std::runtime_error("pipe2 failed");
    read = fds[0];
    write = fds[1];
  }
};

inline void CloseFd(int& fd) {
  if (fd >= 0) close(fd);
  fd = -1;
}

}  // namespace Detail

// A run that has not ended after `limit` is killed and reported with exit code -1; the limit
// only guards against a hung test, it is far above any expected run time.
inline CliResult RunCli(const std::vector<std::string>& arguments, const std::string& input = "",
                        std::chrono::seconds limit = std::chrono::seconds(600)) {
  std::vector<std::string> argv = {CliBinary()};
  argv.insert(argv.end(), arguments.begin(), arguments.end());
  std::vector<char*> pointers;
  for (std::string& argument : argv) pointers.push_back(&argument[0]);
  pointers.push_back(nullptr);

  Detail::Pipe in, out, err;
  const pid_t pid = fork();
  if (pid < 0) throw std::runtime_error("fork failed");
  if (pid == 0) {
    dup2(in.read, STDIN_FILENO);
    dup2(out.write, STDOUT_FILENO);
    dup2(err.write, STDERR_FILENO);
    execv(pointers[0], pointers.data());
    _exit(127);
  }
  Detail::CloseFd(in.read);
  Detail::CloseFd(out.write);
  Detail::CloseFd(err.write);
  // Passwords and small inputs fit the pipe's buffer, so writing first cannot block for long.
  signal(SIGPIPE, SIG_IGN);
  for (size_t written = 0; written < input.size();) {
    const ssize_t count = write(in.write, input.data() + written, input.size() - written);
    if (count <= 0) break;
    written += static_cast<size_t>(count);
  }
  Detail::CloseFd(in.write);

  CliResult result;
  const auto deadline = std::chrono::steady_clock::now() + limit;
  pollfd fds[2] = {{out.read, POLLIN, 0}, {err.read, POLLIN, 0}};
  std::string* sinks[2] = {&result.out, &result.err};
  bool killed = false;
  while (fds[0].fd >= 0 || fds[1].fd >= 0) {
    const auto left =
        std::chrono::duration_cast<std::chrono::milliseconds>(deadline - std::chrono::steady_clock::now());
    if (left.count() <= 0) {
      kill(pid, SIGKILL);
      killed = true;
      break;
    }
    if (poll(fds, 2, static_cast<int>(left.count())) < 0) continue;
    for (int i = 0; i < 2; ++i) {
      if (fds[i].fd < 0 || fds[i].revents == 0) continue;
      char buffer[4096];
      const ssize_t count = read(fds[i].fd, buffer, sizeof buffer);
      if (count < 0 && errno == EINTR) continue;
      if (count > 0) {
        sinks[i]->append(buffer, static_cast<size_t>(count));
      } else {
        close(fds[i].fd);
        fds[i].fd = -1;
      }
    }
  }
  for (pollfd& fd : fds) Detail::CloseFd(fd.fd);
  int status = 0;
  waitpid(pid, &status, 0);
  result.exitCode = (!killed && WIFEXITED(status)) ? WEXITSTATUS(status) : -1;
  return result;
}

// A path for a file of this test process below the test's temporary directory.
inline std::string TempPath(const std::string& name) {
  return ::testing::TempDir() + "/ssoclient-cli-" + std::to_string(getpid()) + "-" + name;
}

inline std::string ReadFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
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
