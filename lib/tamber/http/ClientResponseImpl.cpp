#include "tamber/http/ClientResponseImpl.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace Tamber {
namespace Http {

namespace {

constexpr size_t kMaxReasonPhrase = 256;

std::string MakeSafeForMessages(const std::string& text) {
  std::string safe = text.substr(0, kMaxReasonPhrase);
  for (char& c : safe) {
    const unsigned char byte = static_cast<unsigned char>(c);
    if ((byte < 0x20 && c != '\t') || byte >= 0x7f) c = '?';
  }
  return safe;
}

}  // namespace

ClientResponseImpl::ClientResponseImpl(int statusCode, const std::string& reasonPhrase, std::string body)
    : _statusCode(statusCode), _reasonPhrase(MakeSafeForMessages(reasonPhrase)), _body(std::move(body)) {}

size_t ClientResponseImpl::Read(char* buffer, size_t size) {
  const size_t count = std::min(size, _body.size() - _position);
  if (count == 0) return 0;  // `buffer` may be null for an empty read
  std::memcpy(buffer, _body.data() + _position, count);
  _position += count;
  return count;
}

std::string ReasonPhraseOfStatusLine(const std::string& statusLine) {
  std::string line = statusLine;
  while (!line.empty() && (line.back() == '\r' || line.back() == '\n')) line.pop_back();
  // "HTTP/1.1" SP status-code SP reason-phrase
  const std::string::size_type codeStart = line.find(' ');
  if (codeStart == std::string::npos) return "";
  const std::string::size_type reasonStart = line.find(' ', codeStart + 1);
  return reasonStart == std::string::npos ? "" : line.substr(reasonStart + 1);
}

}  // namespace Http
}  // namespace Tamber
