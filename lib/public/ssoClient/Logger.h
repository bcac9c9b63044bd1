#ifndef SSOCLIENT_LOGGER_H
#define SSOCLIENT_LOGGER_H

#include <atomic>

#include "ssoClient/Export.h"
#include "tamber/service/Logging.h"

namespace SsoClient {

// The library's one logger, named "SsoClient"; valid for the life of the process. It traces
// operations at level 64 (off by default) and reports a caller's contract errors at level 8.
// Applications change its level or install a sink through Tamber::Service::GetApp().
SSOCLIENT_API Tamber::Service::Logger* getLogger();

// The same pointer, null until the first call of getLogger.
extern SSOCLIENT_API std::atomic<Tamber::Service::Logger*> logger;

}  // namespace SsoClient

#endif
