#ifndef TAMBER_HTTP_USERAGENTIMPL_H
#define TAMBER_HTTP_USERAGENTIMPL_H

#include <string>

#include "tamber/http/ConnectionSpecImpl.h"
#include "tamber/http/CookieStoreImpl.h"
#include "tamber/http/Curl.h"
#include "tamber/http/UserAgent.h"

namespace Tamber {
namespace Http {

// A user agent: one libcurl easy handle, configured once with the safe defaults and the
// connection's TLS settings, whose cookies and connections live in the agent's store. Only the
// worker thread touches the handle after construction, and only while a transfer of the agent
// runs (which keeps the agent alive).
class UserAgentImpl : public UserAgent {
 public:
  UserAgentImpl(ConnectionSpec* spec, CookieStoreImpl* store);

  ConnectionSpec* GetConnectionSpec() const override { return _spec.get(); }
  void SendRequestAsync(HttpRequest* request, const CompletionFunctor& completion,
                        Ref<PendingRequestItem>& item) override;
  void GetResponse(PendingRequestItem* item, int64_t timeoutMicros, Ref<ClientResponse>& response) override;

  CURL* GetEasy() const { return _easy.get(); }
  // "https://host:port", to which a request's path is appended.
  const std::string& GetOrigin() const { return _origin; }
  // "HTTPS request to host:port", how messages name a request of this agent.
  const std::string& GetDescription() const { return _description; }
  // The TLS description, or null for plain HTTP.
  const SslConnectionSpec* GetSslSpec() const;

 private:
  void Configure();

  const Ref<ConnectionSpec> _spec;
  // The store outlives the easy handle (declared first, destroyed last): the handle's cleanup
  // still uses the store's share.
  const Ref<CookieStoreImpl> _store;
  const std::string _origin;
  const std::string _description;
  Curl::SlistPtr _connectTo;  // set on the easy handle, so it outlives it
  Curl::EasyPtr _easy;
};

}  // namespace Http
}  // namespace Tamber

#endif
