#ifndef TOOLS_CLI_EXITCODES_H
#define TOOLS_CLI_EXITCODES_H

// How the tool ends: the exit codes it documents, the failures it raises itself, and the one
// line it prints for any failure.

#include <exception>
#include <ostream>
#include <stdexcept>
#include <string>

namespace Cli {

enum ExitCode {
  EXIT_CODE_OK = 0,
  EXIT_CODE_OTHER = 1,
  EXIT_CODE_USAGE = 2,
  EXIT_CODE_BAD_CREDENTIALS = 3,
  EXIT_CODE_INVALID_TOKEN = 4,
  EXIT_CODE_COMMUNICATION = 5,
};

// The exit-code table shown at the end of --help.
extern const char EXIT_CODES_HELP[];

// A failure detected by the tool itself, shown under `className` and ending with `code`.
class CliError : public std::runtime_error {
 public:
  CliError(const std::string& className, ExitCode code, const std::string& message);
  const std::string& GetClassName() const { return _className; }
  ExitCode GetCode() const { return _code; }

 private:
  std::string _className;
  ExitCode _code;
};

// No answer in the time allowed. The operation may still be running on another thread, so the
// process must end without unwinding what that thread uses.
class TimeoutError : public CliError {
 public:
  explicit TimeoutError(const std::string& message);
};

// The class shown for a failure: the library's qualified class name, or the tool's own.
std::string ClassNameOf(const std::exception& error);
// Writes "ssoclient: <class>: <message>" as one line (line breaks in the message become spaces).
void ReportError(std::ostream& out, const std::string& className, const std::string& message);
// ReportError for `error`; returns its exit code.
ExitCode ReportException(std::ostream& out, const std::exception& error);

}  // namespace Cli

#endif
