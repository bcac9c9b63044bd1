// Base64 is hand-written rather than taken from OpenSSL's EVP_EncodeBlock/EVP_DecodeBlock: the
// encoder writes no terminator (Base64_Encode fills an exact-size buffer), and EVP's decoder is
// lax (it trims surrounding whitespace only, counts padding as data bytes and accepts stray bits)
// where certificates and GSS legs need strict, whitespace-tolerant decoding.
#include <climits>
#include <cstdint>
#include <cstdio>

#include "tamber/Exception.h"
#include "tamber/StringUtil.h"

namespace Tamber {

namespace {

constexpr char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
constexpr uint8_t kInvalid = 0xFF;
constexpr uint8_t kWhitespace = 0xFE;
constexpr uint8_t kPadding = 0xFD;

struct DecodeTable {
  uint8_t values[UCHAR_MAX + 1];
  constexpr DecodeTable() : values() {
    for (auto& value : values) value = kInvalid;
    for (int i = 0; i < 64; ++i) values[static_cast<unsigned char>(kAlphabet[i])] = static_cast<uint8_t>(i);
    values[static_cast<unsigned char>(' ')] = kWhitespace;
    values[static_cast<unsigned char>('\t')] = kWhitespace;
    values[static_cast<unsigned char>('\r')] = kWhitespace;
    values[static_cast<unsigned char>('\n')] = kWhitespace;
    values[static_cast<unsigned char>('=')] = kPadding;
  }
};

constexpr DecodeTable kDecodeTable;

[[noreturn]] void ThrowAt(const char* problem, size_t offset) {
  throw Base64FormatException(std::string("Invalid base64 text: ") + problem + " at offset " + std::to_string(offset));
}

[[noreturn]] void ThrowUnexpected(unsigned char c, size_t offset) {
  char problem[32];
  std::snprintf(problem, sizeof problem, "unexpected character 0x%02X", c);
  ThrowAt(problem, offset);
}

}  // namespace

size_t Base64_EncodedLength(size_t length) {
  const size_t quanta = length / 3 + (length % 3 != 0 ? 1 : 0);
  if (quanta > SIZE_MAX / 4) throw InvalidArgumentException("Too much data to encode in base64");
  return quanta * 4;
}

size_t Base64_Encode(const unsigned char* data, size_t length, char* out, size_t outSize) {
  const size_t needed = Base64_EncodedLength(length);
  if (outSize < needed) {
    throw InvalidArgumentException("Base64 output buffer of " + std::to_string(outSize) +
                                   " characters is too small, " + std::to_string(needed) + " needed");
  }
  char* p = out;
  size_t i = 0;
  for (; i + 3 <= length; i += 3) {
    const uint32_t bits = (uint32_t{data[i]} << 16) | (uint32_t{data[i + 1]} << 8) | data[i + 2];
    *p++ = kAlphabet[(bits >> 18) & 0x3F];
    *p++ = kAlphabet[(bits >> 12) & 0x3F];
    *p++ = kAlphabet[(bits >> 6) & 0x3F];
    *p++ = kAlphabet[bits & 0x3F];
  }
  const size_t rest = length - i;
  if (rest > 0) {
    const uint32_t bits = (uint32_t{data[i]} << 16) | (rest == 2 ? uint32_t{data[i + 1]} << 8 : 0);
    *p++ = kAlphabet[(bits >> 18) & 0x3F];
    *p++ = kAlphabet[(bits >> 12) & 0x3F];
    *p++ = rest == 2 ? kAlphabet[(bits >> 6) & 0x3F] : '=';
    *p++ = '=';
  }
  return static_cast<size_t>(p - out);
}

namespace StringUtil {

std::string Base64Encode(const unsigned char* data, size_t length) {
  std::string text(Base64_EncodedLength(length), '\0');
  Base64_Encode(data, length, &text[0], text.size());
  return text;
}

std::string Base64Encode(const std::vector<unsigned char>& data) { return Base64Encode(data.data(), data.size()); }

std::vector<unsigned char> Base64Decode(const std::string& text) {
  std::vector<unsigned char> bytes;
  bytes.reserve(text.size() / 4 * 3);
  uint8_t quantum[4];
  size_t filled = 0;
  size_t padding = 0;
  size_t significant = 0;
  bool ended = false;  // a padded quantum closes the text
  for (size_t offset = 0; offset < text.size(); ++offset) {
    const unsigned char c = static_cast<unsigned char>(text[offset]);
    const uint8_t value = kDecodeTable.values[c];
    if (value == kWhitespace) continue;
    if (value == kInvalid) ThrowUnexpected(c, offset);
    if (ended) ThrowAt("data after padding", offset);
    ++significant;
    if (value == kPadding) {
      // Padding stands for the missing third and fourth characters only.
      if (filled < 2) ThrowAt("misplaced padding", offset);
      ++padding;
      quantum[filled++] = 0;
    } else {
      if (padding > 0) ThrowAt("data after padding", offset);
      quantum[filled++] = value;
    }
    if (filled < 4) continue;
    const uint32_t bits = (uint32_t{quantum[0]} << 18) | (uint32_t{quantum[1]} << 12) |
                          (uint32_t{quantum[2]} << 6) | quantum[3];
    // The bits beyond the last byte must be zero, so that every byte string has one encoding.
    if (padding > 0 && (bits & (padding == 1 ? 0xFFu : 0xFFFFu)) != 0) {
      ThrowAt("non-zero bits in the padded quantum ending", offset);
    }
    bytes.push_back(static_cast<unsigned char>(bits >> 16));
    if (padding < 2) bytes.push_back(static_cast<unsigned char>(bits >> 8));
    if (padding < 1) bytes.push_back(static_cast<unsigned char>(bits));
    filled = 0;
    ended = padding > 0;
  }
  if (filled != 0) {
    throw Base64FormatException("Invalid base64 text: " + std::to_string(significant) +
                                " characters, not a multiple of 4");
  }
  return bytes;
}

}  // namespace StringUtil

}  // namespace Tamber
