#ifndef TAMBER_STRINGUTIL_H
#define TAMBER_STRINGUTIL_H

#include <cstddef>
#include <string>
#include <vector>

#include "tamber/Export.h"

namespace Tamber {

namespace StringUtil {

// Standard base64 (RFC 4648 alphabet, with padding), no line breaks.
TAMBER_API std::string Base64Encode(const unsigned char* data, size_t length);
TAMBER_API std::string Base64Encode(const std::vector<unsigned char>& data);
// Decodes standard base64. Whitespace (space, tab, CR, LF) anywhere is skipped, since
// certificates in XML are wrapped; any other character outside the alphabet, bad padding or a
// length that is not a whole number of quanta raises Base64FormatException.
TAMBER_API std::vector<unsigned char> Base64Decode(const std::string& text);

// A fresh random (version 4) UUID in lower-case text form, e.g.
// "1b4e28ba-2fa1-41d2-883f-0016d3cca427".
TAMBER_API std::string GenerateUuid();

// ASCII case mapping; bytes outside A-Z / a-z (UTF-8 sequences included) are left unchanged.
TAMBER_API std::string ToLower(const std::string& text);
TAMBER_API std::string ToUpper(const std::string& text);

}  // namespace StringUtil

// The number of characters Base64_Encode writes for `length` bytes.
TAMBER_API size_t Base64_EncodedLength(size_t length);
// Encodes `length` bytes into `out` (room for `outSize` characters, no terminator written) and
// returns the number of characters written. Raises InvalidArgumentException if `out` is too small.
TAMBER_API size_t Base64_Encode(const unsigned char* data, size_t length, char* out, size_t outSize);

}  // namespace Tamber

#endif
