#include <openssl/bn.h>
#include <openssl/evp.h>
#include <openssl/pem.h>
#include <openssl/rand.h>
#include <openssl/rsa.h>
#include <openssl/x509.h>
#include <openssl/x509v3.h>
#include <sys/stat.h>

#include <filesystem>
#include <functional>
#include <memory>
#include <stdexcept>
#include <string>

#include "DevSts.h"
#include "KeyDirectory.h"
#include "tamber/crypto/OpenSsl.h"

namespace DevSts {

namespace {

// Development keys last long enough never to expire under a demo or a test run.
const long VALIDITY_SECONDS = 10L * 365 * 24 * 3600;

using Key = Tamber::Crypto::EvpPkeyPtr;
using Certificate = Tamber::Crypto::X509Ptr;

void Require(bool ok, const std::string& what) {
  if (!ok) throw std::runtime_error("Key generation failed: " + what);
}

Key NewRsaKey() {
  Key key(EVP_RSA_gen(2048));
  Require(key != nullptr, "RSA-2048 key");
  return key;
}

void AddExtension(X509* certificate, X509* issuer, int nid, const char* value) {
  X509V3_CTX context;
  X509V3_set_ctx_nodb(&context);
  X509V3_set_ctx(&context, issuer, certificate, nullptr, nullptr, 0);
  const std::unique_ptr<X509_EXTENSION, decltype(&X509_EXTENSION_free)> extension(
      X509V3_EXT_conf_nid(nullptr, &context, nid, value), &X509_EXTENSION_free);
  Require(extension && X509_add_ext(certificate, extension.get(), -1) == 1, std::string("extension ") + value);
}

// An unsigned certificate for `key` named `commonName`, to be issued by `issuer`, or
// to be self-signed when `issuer` is null.
Certificate NewCertificate(EVP_PKEY* key, const std::string& commonName, X509* issuer) {
  Certificate certificate(X509_new());
  Require(certificate != nullptr, "certificate");
  X509_set_version(certificate.get(), 2);
  unsigned char serial[16];
  Require(RAND_bytes(serial, sizeof serial) == 1, "serial number");
  serial[0] &= 0x7f;  // positive
  const std::unique_ptr<BIGNUM, decltype(&BN_free)> number(BN_bin2bn(serial, sizeof serial, nullptr), &BN_free);
  Require(number != nullptr && BN_to_ASN1_INTEGER(number.get(), X509_get_serialNumber(certificate.get())) != nullptr,
          "serial number");
  X509_gmtime_adj(X509_getm_notBefore(certificate.get()), -3600);
  X509_gmtime_adj(X509_getm_notAfter(certificate.get()), VALIDITY_SECONDS);
  X509_NAME* name = X509_get_subject_name(certificate.get());
  X509_NAME_add_entry_by_txt(name, "O", MBSTRING_UTF8, reinterpret_cast<const unsigned char*>("SsoClient Dev STS"), -1,
                             -1, 0);
  X509_NAME_add_entry_by_txt(name, "CN", MBSTRING_UTF8, reinterpret_cast<const unsigned char*>(commonName.c_str()), -1,
                             -1, 0);
  X509* signer = issuer == nullptr ? certificate.get() : issuer;
  X509_set_issuer_name(certificate.get(), X509_get_subject_name(signer));
  X509_set_pubkey(certificate.get(), key);
  AddExtension(certificate.get(), signer, NID_subject_key_identifier, "hash");
  if (issuer == nullptr) {
    AddExtension(certificate.get(), signer, NID_basic_constraints, "critical,CA:TRUE");
    AddExtension(certificate.get(), signer, NID_key_usage, "critical,keyCertSign,cRLSign");
  } else {
    AddExtension(certificate.get(), signer, NID_authority_key_identifier, "keyid:always");
    AddExtension(certificate.get(), signer, NID_basic_constraints, "critical,CA:FALSE");
  }
  return certificate;
}

void Sign(X509* certificate, EVP_PKEY* issuerKey) {
  Require(X509_sign(certificate, issuerKey, EVP_sha256()) > 0, "signature");
}

void WriteFile(const std::string& path, bool secret, const std::function<int(BIO*)>& write) {
  const Tamber::Crypto::BioPtr bio(BIO_new_file(path.c_str(), "w"));
  Require(bio != nullptr, "cannot write " + path);
  if (secret) chmod(path.c_str(), S_IRUSR | S_IWUSR);
  Require(write(bio.get()) == 1, "cannot write " + path);
}

void WriteIdentity(const std::string& directory, const char* certificateFile, const char* keyFile, X509* certificate,
                   EVP_PKEY* key) {
  WriteFile(KeyPath(directory, certificateFile), false, [&](BIO* bio) { return PEM_write_bio_X509(bio, certificate); });
  WriteFile(KeyPath(directory, keyFile), true, [&](BIO* bio) {
    return PEM_write_bio_PrivateKey(bio, key, nullptr, nullptr, 0, nullptr, nullptr);
  });
}

}  // namespace

void GenerateKeys(const std::string& directory) {
  std::filesystem::create_directories(directory);

  const Key caKey = NewRsaKey();
  const Certificate ca = NewCertificate(caKey.get(), "SsoClient Dev STS CA", nullptr);
  Sign(ca.get(), caKey.get());
  WriteIdentity(directory, CA_CERTIFICATE_FILE, CA_KEY_FILE, ca.get(), caKey.get());

  const Key signingKey = NewRsaKey();
  const Certificate signing = NewCertificate(signingKey.get(), "SsoClient Dev STS Signer", ca.get());
  AddExtension(signing.get(), ca.get(), NID_key_usage, "critical,digitalSignature");
  Sign(signing.get(), caKey.get());
  WriteIdentity(directory, SIGNING_CERTIFICATE_FILE, SIGNING_KEY_FILE, signing.get(), signingKey.get());

  const Key tlsKey = NewRsaKey();
  const Certificate tls = NewCertificate(tlsKey.get(), "localhost", ca.get());
  AddExtension(tls.get(), ca.get(), NID_key_usage, "critical,digitalSignature,keyEncipherment");
  AddExtension(tls.get(), ca.get(), NID_ext_key_usage, "serverAuth");
  AddExtension(tls.get(), ca.get(), NID_subject_alt_name, "DNS:localhost,IP:127.0.0.1,IP:::1");
  Sign(tls.get(), caKey.get());
  WriteIdentity(directory, TLS_CERTIFICATE_FILE, TLS_KEY_FILE, tls.get(), tlsKey.get());

  const Key clientKey = NewRsaKey();
  const Certificate client = NewCertificate(clientKey.get(), "demo-solution@example.com", ca.get());
  AddExtension(client.get(), ca.get(), NID_key_usage, "critical,digitalSignature");
  AddExtension(client.get(), ca.get(), NID_ext_key_usage, "clientAuth");
  Sign(client.get(), caKey.get());
  WriteIdentity(directory, CLIENT_CERTIFICATE_FILE, CLIENT_KEY_FILE, client.get(), clientKey.get());
}

}  // namespace DevSts
