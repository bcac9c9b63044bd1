#include "tamber/http/CookieStoreImpl.h"

#include "tamber/Exception.h"

namespace Tamber {
namespace Http {

namespace {

void CheckShare(CURLSHcode code, const char* option) {
  if (code != CURLSHE_OK) {
    throw InvalidStateException(std::string("libcurl refused ") + option + ": " + curl_share_strerror(code));
  }
}

}  // namespace

CookieStoreImpl::CookieStoreImpl(const std::string& name) : _name(name) {
  Curl::GlobalInit();
  _share.reset(curl_share_init());
  if (!_share) throw InvalidStateException("libcurl could not create a cookie store");
  CURLSH* share = _share.get();
  CheckShare(curl_share_setopt(share, CURLSHOPT_LOCKFUNC, &CookieStoreImpl::Lock), "CURLSHOPT_LOCKFUNC");
  CheckShare(curl_share_setopt(share, CURLSHOPT_UNLOCKFUNC, &CookieStoreImpl::Unlock), "CURLSHOPT_UNLOCKFUNC");
  CheckShare(curl_share_setopt(share, CURLSHOPT_USERDATA, this), "CURLSHOPT_USERDATA");
  CheckShare(curl_share_setopt(share, CURLSHOPT_SHARE, CURL_LOCK_DATA_COOKIE), "CURL_LOCK_DATA_COOKIE");
  CheckShare(curl_share_setopt(share, CURLSHOPT_SHARE, CURL_LOCK_DATA_CONNECT), "CURL_LOCK_DATA_CONNECT");
}

void CookieStoreImpl::Lock(CURL*, curl_lock_data data, curl_lock_access, void* store) {
  static_cast<CookieStoreImpl*>(store)->_locks[data].lock();
}

void CookieStoreImpl::Unlock(CURL*, curl_lock_data data, void* store) {
  static_cast<CookieStoreImpl*>(store)->_locks[data].unlock();
}

void CreateCookieStore(const std::string& name, Ref<CookieStore>& store) { store = new CookieStoreImpl(name); }

}  // namespace Http
}  // namespace Tamber
