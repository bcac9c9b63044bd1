#ifndef SSOCLIENT_LOG_H
#define SSOCLIENT_LOG_H

// Emitting messages through the library's logger.

#include "ssoClient/Logger.h"
#include "tamber/service/Logging.h"

// Formats and emits one message at `level` when the library's logger is at least at that level.
// The arguments are evaluated only then, so descriptions of tokens and token requests cost
// nothing while tracing is off.
#define SSOCLIENT_LOG(level, ...)                                                \
  do {                                                                           \
    const ::Tamber::Service::Logger* ssoClientLogger = ::SsoClient::getLogger(); \
    if (ssoClientLogger->GetLevel() >= (level)) {                                \
      ::Tamber::Service::LogInternal(ssoClientLogger, (level), __VA_ARGS__);     \
    }                                                                            \
  } while (false)

#endif
