#ifndef TAMBER_HTTP_COOKIESTOREIMPL_H
#define TAMBER_HTTP_COOKIESTOREIMPL_H

#include <atomic>
#include <mutex>
#include <string>

#include "tamber/http/CookieStore.h"
#include "tamber/http/Curl.h"

namespace Tamber {
namespace Http {

// A libcurl share holding the cookies and the connection cache of the one user agent that uses
// it. Keeping the connections here rather than in the process-wide multi handle is what keeps
// agents apart: libcurl would otherwise hand one agent's open (already verified, possibly
// client-authenticated) TLS connection to another agent with other TLS settings.
class CookieStoreImpl : public CookieStore {
 public:
  explicit CookieStoreImpl(const std::string& name);

  const std::string& GetName() const override { return _name; }

  // Reserves the store for one user agent; false when another has it already.
  bool Bind() { return !_bound.exchange(true); }
  CURLSH* GetShare() const { return _share.get(); }

 private:
  static void Lock(CURL* easy, curl_lock_data data, curl_lock_access access, void* store);
  static void Unlock(CURL* easy, curl_lock_data data, void* store);

  const std::string _name;
  std::atomic<bool> _bound{false};
  // Declared before the share, so destroyed after it: the share's cleanup takes the locks.
  std::mutex _locks[CURL_LOCK_DATA_LAST];
  Curl::SharePtr _share;
};

}  // namespace Http
}  // namespace Tamber

#endif
