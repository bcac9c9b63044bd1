#include "CommonOptions.h"

namespace Cli {

std::chrono::milliseconds CommonOptions::Timeout() const {
  return std::chrono::milliseconds(static_cast<long long>(timeoutSec * 1000));
}

void AddCommonOptions(CLI::App& app, CommonOptions& options) {
  app.add_option("--sts", options.stsUrl, "STS endpoint URL, https://host:port/path");
  app.add_option("--ca", options.caFile,
                 "PEM file of the CAs trusted for the STS's TLS certificate (default: system store)")
      ->check(CLI::ExistingFile);
  app.add_option("--pin", options.pin,
                 "SHA-256 thumbprint of the STS's TLS certificate (64 hex digits, colons allowed); when given, "
                 "it alone decides whether the server is trusted");
  app.add_option("--sts-cert", options.stsCertificateFiles,
                 "PEM file of a trusted token signing certificate (repeatable)")
      ->check(CLI::ExistingFile);
  app.add_option("--timeout", options.timeoutSec, "seconds to wait for the STS")
      ->capture_default_str()
      ->check(CLI::PositiveNumber);
  app.add_flag("--verbose", options.verbose, "trace the library's operations on stderr");
  app.add_flag("--dump-soap", options.dumpSoap,
               "print each SOAP request and answer on stderr, passwords, signature values and SPNEGO legs redacted");
  app.add_flag("--json", options.json, "print results as JSON");
  app.add_option("-o,--out", options.outFile, "write the token's XML to this file (default: stdout)");
}

}  // namespace Cli
