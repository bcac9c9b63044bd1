#include "tamber/http/Curl.h"

#include <mutex>
#include <string>

#include "tamber/Exception.h"

namespace Tamber {
namespace Http {
namespace Curl {

void GlobalInit() {
  static std::once_flag once;
  static CURLcode result = CURLE_OK;
  std::call_once(once, [] { result = curl_global_init(CURL_GLOBAL_DEFAULT); });
  if (result != CURLE_OK) {
    throw InvalidStateException(std::string("libcurl could not be initialised: ") + curl_easy_strerror(result));
  }
}

void Append(SlistPtr& list, const std::string& line) {
  curl_slist* extended = curl_slist_append(list.get(), line.c_str());
  if (extended == nullptr) throw InvalidStateException("libcurl could not allocate a list entry");
  // On success the old head is part of the extended list.
  static_cast<void>(list.release());
  list.reset(extended);
}

void Check(CURLcode code, const char* option) {
  if (code != CURLE_OK) {
    throw InvalidStateException(std::string("libcurl refused ") + option + ": " + curl_easy_strerror(code));
  }
}

}  // namespace Curl
}  // namespace Http
}  // namespace Tamber
