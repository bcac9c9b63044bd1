#include "tamber/StringUtil.h"

#include <gtest/gtest.h>
#include <openssl/evp.h>

#include <random>
#include <regex>
#include <set>

#include "tamber/Exception.h"

namespace {

using Tamber::Base64FormatException;
using Tamber::StringUtil::Base64Decode;
using Tamber::StringUtil::Base64Encode;

std::vector<unsigned char> Bytes(const std::string& text) { return {text.begin(), text.end()}; }

// OpenSSL's encoder as an independent oracle.
std::string OpenSslBase64(const std::vector<unsigned char>& data) {
  std::string text(4 * ((data.size() + 2) / 3) + 1, '\0');
  const int length = EVP_EncodeBlock(reinterpret_cast<unsigned char*>(&text[0]), data.data(), static_cast<int>(data.size()));
  text.resize(static_cast<size_t>(length));
  return text;
}

TEST(Base64Test, RoundTripsEveryLengthUpTo64) {
  for (size_t length = 0; length <= 64; ++length) {
    SCOPED_TRACE(length);
    std::vector<unsigned char> data(length);
    for (size_t i = 0; i < length; ++i) data[i] = static_cast<unsigned char>(i * 151 + length * 7 + 255);
    const std::string text = Base64Encode(data);
    EXPECT_EQ(text, OpenSslBase64(data));
    EXPECT_EQ(text.size(), Tamber::Base64_EncodedLength(length));
    EXPECT_EQ(Base64Decode(text), data);
  }
}

TEST(Base64Test, EncodesAndDecodesRfc4648Vectors) {
  const std::pair<const char*, const char*> vectors[] = {{"", ""},         {"f", "Zg=="},         {"fo", "Zm8="},
                                                         {"foo", "Zm9v"},  {"foob", "Zm9vYg=="},  {"fooba", "Zm9vYmE="},
                                                         {"foobar", "Zm9vYmFy"}};
  for (const auto& vector : vectors) {
    SCOPED_TRACE(vector.first);
    EXPECT_EQ(Base64Encode(Bytes(vector.first)), vector.second);
    EXPECT_EQ(Base64Decode(vector.second), Bytes(vector.first));
  }
}

TEST(Base64Test, EncodesEveryByteValue) {
  std::vector<unsigned char> data(256);
  for (size_t i = 0; i < data.size(); ++i) data[i] = static_cast<unsigned char>(i);
  EXPECT_EQ(Base64Encode(data.data(), data.size()), OpenSslBase64(data));
  EXPECT_EQ(Base64Decode(OpenSslBase64(data)), data);
}

TEST(Base64Test, SkipsWhitespaceAnywhere) {
  EXPECT_EQ(Base64Decode("Zm9v\r\nYmFy"), Bytes("foobar"));
  EXPECT_EQ(Base64Decode(" Z m\t9v\nYg =\r\n= \n"), Bytes("foob"));
  EXPECT_EQ(Base64Decode(" \t\r\n"), Bytes(""));
}

// Strictness means one encoding per byte string: whatever is accepted re-encodes to the same
// text, whitespace aside.
TEST(Base64Test, AcceptsOnlyCanonicalText) {
  const char alphabet[] = "AQgw/+=\n !";
  std::mt19937 random(4648);
  int accepted = 0;
  for (int i = 0; i < 20000; ++i) {
    std::string text(random() % 13, ' ');
    for (char& c : text) c = alphabet[random() % (sizeof alphabet - 1)];
    std::string significant;
    for (char c : text) {
      if (c != ' ' && c != '\n') significant += c;
    }
    try {
      ASSERT_EQ(Base64Encode(Base64Decode(text)), significant) << text;
      ++accepted;
    } catch (const Base64FormatException&) {
    }
  }
  EXPECT_GT(accepted, 1000);
}

struct RefusalCase {
  std::string text;
  std::string message;
};

class Base64RefusalTest : public testing::TestWithParam<RefusalCase> {};

TEST_P(Base64RefusalTest, RaisesFormatExceptionSayingWhatIsWrong) {
  SCOPED_TRACE(GetParam().text);
  try {
    Base64Decode(GetParam().text);
    ADD_FAILURE() << "accepted";
  } catch (const Base64FormatException& e) {
    EXPECT_EQ(std::string(e.what()), GetParam().message);
  }
}

INSTANTIATE_TEST_SUITE_P(
    Table, Base64RefusalTest,
    testing::Values(
        RefusalCase{"Zm9v!", "Invalid base64 text: unexpected character 0x21 at offset 4"},
        RefusalCase{std::string("Zm\0v", 4), "Invalid base64 text: unexpected character 0x00 at offset 2"},
        RefusalCase{"Zm9v-_==", "Invalid base64 text: unexpected character 0x2D at offset 4"},
        RefusalCase{"Zm9v\xC3\xA9", "Invalid base64 text: unexpected character 0xC3 at offset 4"},
        RefusalCase{"Zm9v\vYmFy", "Invalid base64 text: unexpected character 0x0B at offset 4"},
        RefusalCase{"Zg=", "Invalid base64 text: 3 characters, not a multiple of 4"},
        RefusalCase{"Zm9vY", "Invalid base64 text: 5 characters, not a multiple of 4"},
        RefusalCase{"Zm9v Y\n", "Invalid base64 text: 5 characters, not a multiple of 4"},
        RefusalCase{"Z===", "Invalid base64 text: misplaced padding at offset 1"},
        RefusalCase{"====", "Invalid base64 text: misplaced padding at offset 0"},
        RefusalCase{"Zm=v", "Invalid base64 text: data after padding at offset 3"},
        RefusalCase{"Zg==Zg==", "Invalid base64 text: data after padding at offset 4"},
        RefusalCase{"Zm8=\n=", "Invalid base64 text: data after padding at offset 5"},
        RefusalCase{"Zh==", "Invalid base64 text: non-zero bits in the padded quantum ending at offset 3"},
        RefusalCase{"Zm9=", "Invalid base64 text: non-zero bits in the padded quantum ending at offset 3"}));

TEST(Base64Test, EncodedLengthCoversWholeQuanta) {
  EXPECT_EQ(Tamber::Base64_EncodedLength(0), 0u);
  EXPECT_EQ(Tamber::Base64_EncodedLength(1), 4u);
  EXPECT_EQ(Tamber::Base64_EncodedLength(3), 4u);
  EXPECT_EQ(Tamber::Base64_EncodedLength(4), 8u);
  EXPECT_THROW(Tamber::Base64_EncodedLength(SIZE_MAX), Tamber::InvalidArgumentException);
}

TEST(Base64Test, EncodeIntoBufferWritesExactlyTheEncodedLength) {
  const unsigned char data[] = {'f', 'o', 'o', 'b'};
  char buffer[10];
  std::fill(std::begin(buffer), std::end(buffer), '#');
  EXPECT_EQ(Tamber::Base64_Encode(data, sizeof data, buffer, 8), 8u);
  EXPECT_EQ(std::string(buffer, 10), "Zm9vYg==##");
}

TEST(Base64Test, EncodeIntoSmallBufferRaisesInvalidArgument) {
  const unsigned char data[] = {'f', 'o', 'o', 'b'};
  char buffer[7];
  try {
    Tamber::Base64_Encode(data, sizeof data, buffer, sizeof buffer);
    FAIL() << "wrote past the buffer";
  } catch (const Tamber::InvalidArgumentException& e) {
    EXPECT_STREQ(e.what(), "Invalid argument : Base64 output buffer of 7 characters is too small, 8 needed");
  }
}

TEST(UuidTest, IsVersion4InLowerCase) {
  const std::regex form("[0-9a-f]{8}-[0-9a-f]{4}-4[0-9a-f]{3}-[89ab][0-9a-f]{3}-[0-9a-f]{12}");
  for (int i = 0; i < 100; ++i) {
    const std::string uuid = Tamber::StringUtil::GenerateUuid();
    ASSERT_TRUE(std::regex_match(uuid, form)) << uuid;
  }
}

TEST(UuidTest, IsFreshOnEveryCall) {
  std::set<std::string> seen;
  for (int i = 0; i < 10000; ++i) ASSERT_TRUE(seen.insert(Tamber::StringUtil::GenerateUuid()).second);
}

TEST(CaseTest, MapsAsciiLettersOnly) {
  const std::string mixed = "Az@[`{09 \xC3\x84\xC3\xA4 Zz";  // boundaries of A-Z/a-z and UTF-8 "Ää"
  EXPECT_EQ(Tamber::StringUtil::ToLower(mixed), "az@[`{09 \xC3\x84\xC3\xA4 zz");
  EXPECT_EQ(Tamber::StringUtil::ToUpper(mixed), "AZ@[`{09 \xC3\x84\xC3\xA4 ZZ");
  EXPECT_EQ(Tamber::StringUtil::ToLower(""), "");
}

}  // namespace
