#include "PasswordInput.h"

#include <termios.h>
#include <unistd.h>

#include <iostream>
#include <sstream>

#include "ExitCodes.h"
#include "InputFiles.h"

namespace Cli {
namespace {

std::string FirstLine(std::istream& in) {
  std::string line;
  std::getline(in, line);
  if (!line.empty() && line.back() == '\r') line.pop_back();
  return line;
}

// Turns terminal echo off for its lifetime, so that an exception still restores it.
class EchoOff {
 public:
  EchoOff() : _saved(), _active(tcgetattr(STDIN_FILENO, &_saved) == 0) {
    if (!_active) return;
    termios quiet = _saved;
    quiet.c_lflag &= ~static_cast<tcflag_t>(ECHO);
    _active = tcsetattr(STDIN_FILENO, TCSAFLUSH, &quiet) == 0;
  }
  ~EchoOff() {
    if (_active) tcsetattr(STDIN_FILENO, TCSAFLUSH, &_saved);
  }
  EchoOff(const EchoOff&) = delete;
  EchoOff& operator=(const EchoOff&) = delete;

 private:
  termios _saved;
  bool _active;
};

std::string Prompt(const std::string& user) {
  std::cerr << "Password for " << user << ": " << std::flush;
  std::string password;
  {
    EchoOff echoOff;
    password = FirstLine(std::cin);
  }
  std::cerr << std::endl;
  return password;
}

}  // namespace

std::string ReadPassword(const std::string& user, const std::string& passwordFile) {
  std::string password;
  std::string source;
  if (!passwordFile.empty()) {
    std::istringstream text(ReadTextFile(passwordFile));
    password = FirstLine(text);
    source = "the first line of '" + passwordFile + "'";
  } else if (isatty(STDIN_FILENO)) {
    password = Prompt(user);
    source = "the prompt";
  } else {
    password = FirstLine(std::cin);
    source = "the first line of standard input";
  }
  if (password.empty()) {
    throw CliError("UsageError", EXIT_CODE_USAGE, "expected a password on " + source + ", found an empty line");
  }
  return password;
}

}  // namespace Cli
