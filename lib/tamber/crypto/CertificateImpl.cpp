#include "tamber/crypto/CertificateImpl.h"

#include <openssl/err.h>
#include <openssl/pem.h>
#include <openssl/sha.h>

#include <climits>
#include <memory>
#include <string_view>

#include "tamber/crypto/LruCache.h"

namespace Tamber {
namespace Crypto {

namespace {

// Decoding a certificate costs OpenSSL 3 about 110 µs, and the same few certificates come back
// with every token (signer in ds:KeyInfo, holder-of-key confirmation), so decoded certificates
// are shared by DER. Bounded both in entries and in the size of what is kept.
constexpr size_t kCachedCertificates = 256;
constexpr size_t kLargestCachedDer = 64 * 1024;

LruCache<Ref<const CertificateImpl>>& DecodedCertificates() {
  // Never destroyed: the X509 objects must not be freed after OpenSSL's own exit handler ran.
  static auto* cache = new LruCache<Ref<const CertificateImpl>>(kCachedCertificates);
  return *cache;
}

std::string PrintName(const X509_NAME* name) {
  BioPtr bio(BIO_new(BIO_s_mem()));
  // RFC 2253 form, but with UTF-8 left as it is rather than escaped byte by byte.
  if (!bio || X509_NAME_print_ex(bio.get(), name, 0, XN_FLAG_RFC2253 & ~ASN1_STRFLGS_ESC_MSB) < 0) {
    throw CryptoException("Certificate name cannot be printed: " + TakeOpenSslError());
  }
  char* data = nullptr;
  long length = BIO_get_mem_data(bio.get(), &data);
  return std::string(data, static_cast<size_t>(length));
}

std::string Sha256(const std::vector<unsigned char>& bytes) {
  unsigned char digest[SHA256_DIGEST_LENGTH];
  SHA256(bytes.data(), bytes.size(), digest);
  return std::string(reinterpret_cast<const char*>(digest), sizeof digest);
}

[[noreturn]] void ThrowNotDer(const std::string& reason) {
  throw CryptoException("Certificate is not valid DER: " + reason);
}

}  // namespace

CertificateImpl::CertificateImpl(X509Ptr x509, std::vector<unsigned char> der)
    : _x509(std::move(x509)),
      _der(std::move(der)),
      _subjectName(PrintName(X509_get_subject_name(_x509.get()))),
      _issuerName(PrintName(X509_get_issuer_name(_x509.get()))),
      _notBefore(ToDateTime(X509_get0_notBefore(_x509.get()), "notBefore")),
      _notAfter(ToDateTime(X509_get0_notAfter(_x509.get()), "notAfter")),
      _sha256(Sha256(_der)) {}

std::string CertificateImpl::GetSha256Thumbprint() const {
  static const char kHex[] = "0123456789abcdef";
  std::string hex;
  hex.reserve(_sha256.size() * 2);
  for (unsigned char byte : _sha256) {
    hex += kHex[byte >> 4];
    hex += kHex[byte & 0x0f];
  }
  return hex;
}

const CertificateImpl& ToCertificateImpl(const Certificate& certificate) {
  return *DynamicCast<const CertificateImpl>(&certificate);
}

X509* GetX509(const Certificate& certificate) { return ToCertificateImpl(certificate).GetX509(); }

EVP_PKEY* GetPublicKey(const Certificate& certificate) { return ToCertificateImpl(certificate).GetPublicKey(); }

void CreateCertificate(const unsigned char* bytes, size_t length, Ref<const Certificate>& certificate) {
  if (bytes == nullptr || length == 0) ThrowNotDer("no bytes");
  std::string_view key(reinterpret_cast<const char*>(bytes), length);
  Ref<const CertificateImpl> decoded;
  if (DecodedCertificates().Find(key, decoded)) {
    certificate = decoded;
    return;
  }
  if (length > static_cast<size_t>(LONG_MAX)) ThrowNotDer("too many bytes");
  const unsigned char* end = bytes;
  X509Ptr x509(d2i_X509(nullptr, &end, static_cast<long>(length)));
  if (!x509) ThrowNotDer(TakeOpenSslError());
  size_t trailing = length - static_cast<size_t>(end - bytes);
  if (trailing != 0) {
    ThrowNotDer(std::to_string(trailing) + (trailing == 1 ? " byte" : " bytes") + " after the end of the certificate");
  }
  decoded = new CertificateImpl(std::move(x509), std::vector<unsigned char>(bytes, bytes + length));
  if (length <= kLargestCachedDer) DecodedCertificates().Insert(std::string(key), decoded);
  certificate = decoded;
}

namespace {

// Reads the PEM blocks of `pem` in order and hands the DER of each CERTIFICATE block to
// `onCertificate`; returns false once it asks to stop.
template <class OnCertificate>
void ForEachPemCertificate(const std::string& pem, OnCertificate onCertificate) {
  if (pem.size() > static_cast<size_t>(INT_MAX)) throw CryptoException("PEM text is too long");
  BioPtr bio(BIO_new_mem_buf(pem.data(), static_cast<int>(pem.size())));
  if (!bio) throw CryptoException("PEM text cannot be read: " + TakeOpenSslError());
  for (;;) {
    char* name = nullptr;
    char* header = nullptr;
    unsigned char* data = nullptr;
    long length = 0;
    if (PEM_read_bio(bio.get(), &name, &header, &data, &length) != 1) {
      unsigned long error = ERR_peek_last_error();
      if (ERR_GET_LIB(error) == ERR_LIB_PEM && ERR_GET_REASON(error) == PEM_R_NO_START_LINE) {
        ERR_clear_error();  // the end of the text
        return;
      }
      throw CryptoException("PEM text is malformed: " + TakeOpenSslError());
    }
    std::unique_ptr<char, void (*)(void*)> nameOwner(name, [](void* p) { OPENSSL_free(p); });
    std::unique_ptr<char, void (*)(void*)> headerOwner(header, [](void* p) { OPENSSL_free(p); });
    std::unique_ptr<unsigned char, void (*)(void*)> dataOwner(data, [](void* p) { OPENSSL_free(p); });
    if (std::string(name) == PEM_STRING_X509 && !onCertificate(data, static_cast<size_t>(length))) return;
  }
}

}  // namespace

void CreateCertificateFromPem(const std::string& pem, Ref<const Certificate>& certificate) {
  Ref<const Certificate> first;
  ForEachPemCertificate(pem, [&first](const unsigned char* der, size_t length) {
    CreateCertificate(der, length, first);
    return false;
  });
  if (!first) throw CryptoException("PEM text holds no CERTIFICATE block");
  certificate = first;
}

void CreateCertificatesFromPem(const std::string& pem, std::vector<Ref<const Certificate>>& certificates) {
  std::vector<Ref<const Certificate>> found;
  ForEachPemCertificate(pem, [&found](const unsigned char* der, size_t length) {
    Ref<const Certificate> certificate;
    CreateCertificate(der, length, certificate);
    found.push_back(certificate);
    return true;
  });
  if (found.empty()) throw CryptoException("PEM text holds no CERTIFICATE block");
  certificates.swap(found);
}

}  // namespace Crypto
}  // namespace Tamber
