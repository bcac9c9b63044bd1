#ifndef TAMBER_HTTP_CURL_H
#define TAMBER_HTTP_CURL_H

// Internal helpers over libcurl for the HTTP client of the layer.

#include <memory>
#include <string>

#include <curl/curl.h>

namespace Tamber {
namespace Http {
namespace Curl {

// Initialises libcurl once per process, thread-safely; later calls return at once. Raises
// InvalidStateException when libcurl cannot be initialised.
void GlobalInit();

// CURL and CURLSH are both void, hence one deleter each.
struct EasyDeleter {
  void operator()(CURL* easy) const { curl_easy_cleanup(easy); }
};
struct ShareDeleter {
  void operator()(CURLSH* share) const { curl_share_cleanup(share); }
};
struct SlistDeleter {
  void operator()(curl_slist* list) const { curl_slist_free_all(list); }
};
using EasyPtr = std::unique_ptr<CURL, EasyDeleter>;
using SharePtr = std::unique_ptr<CURLSH, ShareDeleter>;
using SlistPtr = std::unique_ptr<curl_slist, SlistDeleter>;

// Appends a line to a libcurl string list; raises InvalidStateException when out of memory.
void Append(SlistPtr& list, const std::string& line);

// Raises InvalidStateException naming the option when libcurl refuses it: every option the
// layer sets is needed for its safety, so a libcurl that lacks one must not be used.
void Check(CURLcode code, const char* option);

}  // namespace Curl
}  // namespace Http
}  // namespace Tamber

// Sets an easy option and checks it; the option's name goes into the message.
#define TAMBER_CURL_SET(easy, option, value) \
  ::Tamber::Http::Curl::Check(curl_easy_setopt((easy), option, (value)), #option)

#endif
