#include "ssoClient/Logger.h"

#include "tamber/Ref.h"

namespace SsoClient {

std::atomic<Tamber::Service::Logger*> logger{nullptr};

Tamber::Service::Logger* getLogger() {
  Tamber::Service::Logger* published = logger.load(std::memory_order_acquire);
  if (published != nullptr) return published;

  Tamber::Ref<Tamber::Service::Logger> fetched;
  Tamber::Service::GetApp()->GetLogManager()->GetLogger("SsoClient", Tamber::Service::LOG_TRACE, fetched);
  // Exactly one caller publishes; a caller that lost the race answers the winner's logger.
  if (logger.compare_exchange_strong(published, fetched.get(), std::memory_order_acq_rel,
                                     std::memory_order_acquire)) {
    // The published pointer keeps this reference for the life of the process.
    return fetched.detach();
  }
  return published;
}

}  // namespace SsoClient
