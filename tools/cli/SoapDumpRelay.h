#ifndef TOOLS_CLI_SOAPDUMPRELAY_H
#define TOOLS_CLI_SOAPDUMPRELAY_H

// Shows the SOAP traffic of one run. The library's transport is internal and its log never
// carries message text, so the tool points the library at this loopback relay instead of the
// STS: the relay prints each request and answer, redacted, and forwards it over the core
// layer's HTTP client with the run's TLS settings.

#include <cstdint>
#include <memory>
#include <ostream>
#include <string>

#include "tamber/ssl/SSLContext.h"

namespace Cli {

class SoapDumpRelay {
 public:
  // Listens on an ephemeral loopback port until destroyed. `sslContext` and `pin` secure the
  // forward leg to an https `stsUrl`; `timeoutMicros` bounds each wait for the STS.
  SoapDumpRelay(const std::string& stsUrl, Tamber::Ssl::SSLContext* sslContext, const std::string& pin,
                int64_t timeoutMicros, std::ostream& dump);
  ~SoapDumpRelay();
  SoapDumpRelay(const SoapDumpRelay&) = delete;
  SoapDumpRelay& operator=(const SoapDumpRelay&) = delete;

  // "http://127.0.0.1:PORT" followed by the path of the STS URL.
  std::string GetUrl() const;

 private:
  struct Impl;
  std::unique_ptr<Impl> _impl;
};

}  // namespace Cli

#endif
