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
  // Sized for the worst case and cut to what was decoded: no per-byte growth checks.
  std::vector<unsigned char> bytes(text.size() / 4 * 3);
  size_t written = 0;
  uint32_t bits = 0;
  size_t filled = 0;
  size_t padding = 0;
  size_t significant = 0;
  bool ended = false;  // a padded quantum closes the text
  const unsigned char* input = reinterpret_cast<const unsigned char*>(text.data());
  for (size_t offset = 0; offset < text.size(); ++offset) {
    // Fast path: a whole quantum of alphabet characters at a quantum boundary.
    while (filled == 0 && !ended && offset + 4 <= text.size()) {
      const uint8_t* values = kDecodeTable.values;
      const uint32_t a = values[input[offset]], b = values[input[offset + 1]], c = values[input[offset + 2]],
                     d = values[input[offset + 3]];
      if ((a | b | c | d) >= 64) break;
      const uint32_t quantum = (a << 18) | (b << 12) | (c << 6) | d;
      bytes[written++] = static_cast<unsigned char>(quantum >> 16);
      bytes[written++] = static_cast<unsigned char>(quantum >> 8);
      bytes[written++] = static_cast<unsigned char>(quantum);
      significant += 4;
      offset += 4;
    }
    if (offset == text.size()) break;
    const unsigned char c = input[offset];
    uint8_t value = kDecodeTable.values[c];
    if (value == kWhitespace) continue;
    if (value == kInvalid) ThrowUnexpected(c, offset);
    if (ended) ThrowAt("data after padding", offset);
    ++significant;
    if (value == kPadding) {
      // Padding stands for the missing third and fourth characters only.
      if (filled < 2) ThrowAt("misplaced padding", offset);
      ++padding;
      value = 0;
    } else if (padding > 0) {
      ThrowAt("data after padding", offset);
    }
    bits = (bits << 6) | value;
    if (++filled < 4) continue;
    // The bits beyond the last byte must be zero, so that every byte string has one encoding.
    if (padding > 0 && (bits & (padding == 1 ? 0xFFu : 0xFFFFu)) != 0) {
      ThrowAt("non-zero bits in the padded quantum ending", offset);
    }
    bytes[written++] = static_cast<unsigned char>(bits >> 16);
    if (padding < 2) bytes[written++] = static_cast<unsigned char>(bits >> 8);
    if (padding < 1) bytes[written++] = static_cast<unsigned char>(bits);
    bits = 0;
    filled = 0;
    ended = padding > 0;
  }
  if (filled != 0) {
    throw Base64FormatException("Invalid base64 text: " + std::to_string(significant) +
                                " characters, not a multiple of 4");
  }
  bytes.resize(written);
  return bytes;
}

}  // namespace StringUtil

}  // namespace Tamber
