#include "tamber/ssl/PeerVerifier.h"

#include <arpa/inet.h>

#include <cstring>

#include <openssl/evp.h>
#include <openssl/x509_vfy.h>

namespace Tamber {
namespace Ssl {

namespace {

bool IsIpAddress(const std::string& host) {
  unsigned char address[sizeof(in6_addr)];
  return inet_pton(AF_INET, host.c_str(), address) == 1 || inet_pton(AF_INET6, host.c_str(), address) == 1;
}

}  // namespace

std::string FormatThumbprint(const unsigned char* bytes, size_t length) {
  static const char kDigits[] = "0123456789abcdef";
  std::string text;
  for (size_t i = 0; i < length; ++i) {
    if (i > 0) text += ':';
    text += kDigits[bytes[i] >> 4];
    text += kDigits[bytes[i] & 0x0f];
  }
  return text;
}

PeerVerifier::PeerVerifier(const SSLContextImpl& context, const std::string& host,
                           const std::vector<unsigned char>& pin)
    : _context(context), _host(host), _pin(pin) {}

bool PeerVerifier::Configure(SSL_CTX* ctx) {
  if (!_context.Apply(ctx, _failure)) return false;
  SSL_CTX_set_options(ctx, SSL_OP_NO_RENEGOTIATION);
  // libcurl writes the session secrets to the file named by SSLKEYLOGFILE; no setting of the
  // environment may weaken a connection.
  SSL_CTX_set_keylog_callback(ctx, nullptr);
  if (IsPinned() || _context.VerifiesPeer()) {
    SSL_CTX_set_verify(ctx, SSL_VERIFY_PEER, nullptr);
    SSL_CTX_set_cert_verify_callback(ctx, &PeerVerifier::VerifyCallback, this);
  } else {
    SSL_CTX_set_verify(ctx, SSL_VERIFY_NONE, nullptr);
  }
  return true;
}

int PeerVerifier::VerifyCallback(X509_STORE_CTX* storeContext, void* verifier) {
  PeerVerifier* self = static_cast<PeerVerifier*>(verifier);
  return (self->IsPinned() ? self->CheckPin(storeContext) : self->CheckChainAndHost(storeContext)) ? 1 : 0;
}

bool PeerVerifier::CheckPin(X509_STORE_CTX* storeContext) {
  X509* certificate = X509_STORE_CTX_get0_cert(storeContext);
  unsigned char digest[EVP_MAX_MD_SIZE];
  unsigned int length = 0;
  if (certificate == nullptr || X509_digest(certificate, EVP_sha256(), digest, &length) != 1) {
    X509_STORE_CTX_set_error(storeContext, X509_V_ERR_APPLICATION_VERIFICATION);
    _failure = "the server presented no usable certificate to check against the pinned thumbprint";
    return false;
  }
  if (length != _pin.size() || std::memcmp(digest, _pin.data(), length) != 0) {
    X509_STORE_CTX_set_error(storeContext, X509_V_ERR_APPLICATION_VERIFICATION);
    _failure = "the server certificate's SHA-256 thumbprint " + FormatThumbprint(digest, length) +
               " does not match the pinned thumbprint " + FormatThumbprint(_pin.data(), _pin.size());
    return false;
  }
  X509_STORE_CTX_set_error(storeContext, X509_V_OK);
  return true;
}

bool PeerVerifier::CheckChainAndHost(X509_STORE_CTX* storeContext) {
  if (_context.VerifiesHostName()) {
    X509_VERIFY_PARAM* param = X509_STORE_CTX_get0_param(storeContext);
    const int set = IsIpAddress(_host) ? X509_VERIFY_PARAM_set1_ip_asc(param, _host.c_str())
                                       : X509_VERIFY_PARAM_set1_host(param, _host.c_str(), _host.size());
    if (set != 1) {
      X509_STORE_CTX_set_error(storeContext, X509_V_ERR_APPLICATION_VERIFICATION);
      _failure = "the host name \"" + _host + "\" cannot be checked";
      return false;
    }
  }
  if (X509_verify_cert(storeContext) == 1) return true;
  const int error = X509_STORE_CTX_get_error(storeContext);
  _failure = std::string("the server certificate was refused: ") + X509_verify_cert_error_string(error);
  return false;
}

}  // namespace Ssl
}  // namespace Tamber
