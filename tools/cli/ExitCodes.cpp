#include "ExitCodes.h"

#include <algorithm>
#include <boost/core/demangle.hpp>

#include "ssoClient/Exceptions.h"
#include "tamber/Exception.h"
#include "tamber/http/HttpException.h"
#include "tamber/xml/Dom.h"

namespace Cli {

const char EXIT_CODES_HELP[] =
    "Exit codes:\n"
    "  0  success\n"
    "  1  any other failure\n"
    "  2  bad usage: unknown or missing options, unreadable input files, invalid arguments\n"
    "  3  bad credentials: the STS refused the user name, password or certificate\n"
    "  4  invalid token: not well-formed, wrong shape, expired, bad or untrusted signature,\n"
    "     or a subject the STS no longer holds valid\n"
    "  5  communication failure: STS unreachable, TLS failure, HTTP error, timeout\n"
    "Failures are reported on stderr as one line: \"ssoclient: <class>: <message>\".";

CliError::CliError(const std::string& className, ExitCode code, const std::string& message)
    : std::runtime_error(message), _className(className), _code(code) {}

TimeoutError::TimeoutError(const std::string& message) : CliError("TimeoutError", EXIT_CODE_COMMUNICATION, message) {}

namespace {

// The exit code for a failure of the tool or of the library.
ExitCode ExitCodeOf(const std::exception& error) {
  if (auto cliError = dynamic_cast<const CliError*>(&error)) return cliError->GetCode();
  if (dynamic_cast<const SsoClient::InvalidCredentialsException*>(&error)) return EXIT_CODE_BAD_CREDENTIALS;
  if (dynamic_cast<const SsoClient::InvalidTokenException*>(&error)) return EXIT_CODE_INVALID_TOKEN;
  if (dynamic_cast<const Tamber::Xml::XMLParseException*>(&error)) return EXIT_CODE_INVALID_TOKEN;
  if (dynamic_cast<const SsoClient::CommunicationException*>(&error)) return EXIT_CODE_COMMUNICATION;
  if (dynamic_cast<const Tamber::Http::HttpException*>(&error)) return EXIT_CODE_COMMUNICATION;
  // Every precondition the library checks (URL, pin, lifetime, key pairs) is the user's input here.
  if (dynamic_cast<const Tamber::InvalidArgumentException*>(&error)) return EXIT_CODE_USAGE;
  return EXIT_CODE_OTHER;
}

}  // namespace

std::string ClassNameOf(const std::exception& error) {
  if (auto cliError = dynamic_cast<const CliError*>(&error)) return cliError->GetClassName();
  return boost::core::demangle(typeid(error).name());
}

void ReportError(std::ostream& out, const std::string& className, const std::string& message) {
  std::string line = message;
  std::replace_if(
      line.begin(), line.end(), [](char c) { return c == '\n' || c == '\r'; }, ' ');
  out << "ssoclient: " << className << ": " << line << std::endl;
}

ExitCode ReportException(std::ostream& out, const std::exception& error) {
  ReportError(out, ClassNameOf(error), error.what());
  return ExitCodeOf(error);
}

}  // namespace Cli
