#include "tamber/crypto/Certificate.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tamber/crypto/CertificateImpl.h"
#include "tamber/crypto/TestKeys.h"

namespace Tamber {
namespace Crypto {
namespace {

const int64_t kMicrosPerDay = 86400LL * 1000000;

std::string OpenSslFingerprint(const std::string& name) {
  int status = 0;
  std::string output = TestKeys::RunCommand(
      "openssl x509 -noout -fingerprint -sha256 -in " + TestKeys::DataPath("keys/" + name + ".pem"), status);
  EXPECT_EQ(0, status) << output;
  // "sha256 Fingerprint=AB:CD:...\n" -> "abcd..."
  std::string hex;
  for (char c : output.substr(output.find('=') + 1)) {
    if (std::isxdigit(static_cast<unsigned char>(c))) hex += static_cast<char>(std::tolower(c));
  }
  return hex;
}

TEST(CertificateTest, ReadsNamesDatesAndThumbprintFromPem) {
  Ref<const Certificate> sts = TestKeys::Certificate("sts");
  EXPECT_EQ("CN=Test STS Signer,O=SsoClient Tests", sts->GetSubjectName());
  EXPECT_EQ("CN=Test CA,O=SsoClient Tests", sts->GetIssuerName());
  EXPECT_EQ(36500 * kMicrosPerDay, sts->GetNotAfter().GetUtcTime() - sts->GetNotBefore().GetUtcTime());
  EXPECT_EQ(OpenSslFingerprint("sts"), sts->GetSha256Thumbprint());
}

TEST(CertificateTest, ReadsTheDatesOfTheExpiredSigner) {
  Ref<const Certificate> expired = TestKeys::Certificate("expired-sts");
  EXPECT_EQ("2001-01-01T00:00:00.000Z", expired->GetNotBefore().ToString());
  EXPECT_EQ("2001-12-31T23:59:59.000Z", expired->GetNotAfter().ToString());
  EXPECT_EQ("CN=Expired STS Signer,O=SsoClient Tests", expired->GetSubjectName());
}

TEST(CertificateTest, DerRoundTripsAndSharesTheDecodedCertificate) {
  Ref<const Certificate> fromPem = TestKeys::Certificate("sts-ec");
  const std::vector<unsigned char>& der = fromPem->GetDer();
  Ref<const Certificate> fromDer;
  CreateCertificate(der.data(), der.size(), fromDer);
  EXPECT_EQ(der, fromDer->GetDer());
  EXPECT_EQ(fromPem->GetSha256Thumbprint(), fromDer->GetSha256Thumbprint());
  // The same DER is decoded once: both are the one shared, immutable object.
  EXPECT_EQ(fromPem.get(), fromDer.get());
}

TEST(CertificateTest, ExposesTheOpenSslObjectsToTheLayer) {
  Ref<const Certificate> sts = TestKeys::Certificate("sts");
  ASSERT_NE(nullptr, GetX509(*sts));
  EXPECT_EQ("RSA", DescribeKeyType(GetPublicKey(*sts)));
  EXPECT_EQ("EC", DescribeKeyType(GetPublicKey(*TestKeys::Certificate("sts-ec"))));
}

TEST(CertificateTest, ReadsEveryCertificateOfAPemTextInOrderSkippingOtherBlocks) {
  std::string pem = TestKeys::ReadDataFile("keys/sts.key") + TestKeys::ReadDataFile("keys/sts.pem") +
                    TestKeys::ReadDataFile("keys/ca.pem");
  std::vector<Ref<const Certificate>> certificates;
  CreateCertificatesFromPem(pem, certificates);
  ASSERT_EQ(2u, certificates.size());
  EXPECT_EQ("CN=Test STS Signer,O=SsoClient Tests", certificates[0]->GetSubjectName());
  EXPECT_EQ("CN=Test CA,O=SsoClient Tests", certificates[1]->GetSubjectName());

  Ref<const Certificate> first;
  CreateCertificateFromPem(pem, first);
  EXPECT_EQ(certificates[0].get(), first.get());
}

struct BadDer {
  const char* name;
  std::vector<unsigned char> bytes;
  std::string message;
};

std::vector<unsigned char> StsDerWith(size_t keep, std::vector<unsigned char> extra) {
  std::vector<unsigned char> der = TestKeys::Certificate("sts")->GetDer();
  der.resize(keep == 0 ? der.size() : keep);
  der.insert(der.end(), extra.begin(), extra.end());
  return der;
}

std::vector<unsigned char> PemBytes() {
  std::string pem = TestKeys::ReadDataFile("keys/sts.pem");
  return std::vector<unsigned char>(pem.begin(), pem.end());
}

class BadDerTest : public testing::TestWithParam<BadDer> {};

TEST_P(BadDerTest, IsRefusedWithCryptoException) {
  const BadDer& row = GetParam();
  SCOPED_TRACE(row.name);
  Ref<const Certificate> certificate;
  try {
    CreateCertificate(row.bytes.data(), row.bytes.size(), certificate);
    FAIL() << "accepted";
  } catch (const CryptoException& e) {
    EXPECT_EQ(row.message, std::string(e.what()));
  }
  EXPECT_FALSE(certificate);
}

INSTANTIATE_TEST_SUITE_P(
    Table, BadDerTest,
    testing::Values(BadDer{"empty", {}, "Certificate is not valid DER: no bytes"},
                    BadDer{"one trailing byte", StsDerWith(0, {0x00}),
                           "Certificate is not valid DER: 1 byte after the end of the certificate"},
                    BadDer{"a second certificate behind", StsDerWith(0, StsDerWith(0, {})),
                           "Certificate is not valid DER: " + std::to_string(StsDerWith(0, {}).size()) +
                               " bytes after the end of the certificate"},
                    BadDer{"truncated", StsDerWith(100, {}), "Certificate is not valid DER: too long"},
                    BadDer{"an integer", {0x02, 0x01, 0x00}, "Certificate is not valid DER: wrong tag"},
                    BadDer{"PEM text instead of DER", PemBytes(), "Certificate is not valid DER: wrong tag"}),
    [](const testing::TestParamInfo<BadDer>& info) { return "Row" + std::to_string(info.index); });

struct BadPem {
  const char* name;
  std::string text;
  const char* message;
};

class BadPemTest : public testing::TestWithParam<BadPem> {};

TEST_P(BadPemTest, IsRefusedWithCryptoException) {
  const BadPem& row = GetParam();
  SCOPED_TRACE(row.name);
  Ref<const Certificate> certificate;
  std::vector<Ref<const Certificate>> certificates;
  try {
    CreateCertificateFromPem(row.text, certificate);
    FAIL() << "accepted";
  } catch (const CryptoException& e) {
    EXPECT_EQ(row.message, std::string(e.what()));
  }
  try {
    CreateCertificatesFromPem(row.text, certificates);
    FAIL() << "accepted";
  } catch (const CryptoException& e) {
    EXPECT_EQ(row.message, std::string(e.what()));
  }
  EXPECT_FALSE(certificate);
  EXPECT_TRUE(certificates.empty());
}

std::string CorruptedPem() {
  std::string pem = TestKeys::ReadDataFile("keys/ca.pem");
  pem[40] = '*';
  return pem;
}

INSTANTIATE_TEST_SUITE_P(
    Table, BadPemTest,
    testing::Values(BadPem{"empty", "", "PEM text holds no CERTIFICATE block"},
                    BadPem{"only a private key", TestKeys::ReadDataFile("keys/sts.key"),
                           "PEM text holds no CERTIFICATE block"},
                    BadPem{"bad base64", CorruptedPem(), "PEM text is malformed: bad base64 decode"},
                    BadPem{"DER inside is not a certificate",
                           "-----BEGIN CERTIFICATE-----\nAgEA\n-----END CERTIFICATE-----\n",
                           "Certificate is not valid DER: wrong tag"}),
    [](const testing::TestParamInfo<BadPem>& info) { return "Row" + std::to_string(info.index); });

}  // namespace
}  // namespace Crypto
}  // namespace Tamber
