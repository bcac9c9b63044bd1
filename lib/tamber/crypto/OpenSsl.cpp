#include "tamber/crypto/OpenSsl.h"

#include <openssl/err.h>

#include <ctime>

namespace Tamber {
namespace Crypto {

std::string DescribeKeyType(const EVP_PKEY* key) {
  int type = EVP_PKEY_get_base_id(key);
  if (type == EVP_PKEY_RSA) return "RSA";
  if (type == EVP_PKEY_EC) return "EC";
  const char* name = OBJ_nid2sn(type);
  return name != nullptr ? name : "unknown";
}

std::string TakeOpenSslError() {
  unsigned long error = ERR_get_error();
  const char* reason = error != 0 ? ERR_reason_error_string(error) : nullptr;
  ERR_clear_error();
  return reason != nullptr ? reason : "unknown error";
}

System::DateTime ToDateTime(const ASN1_TIME* time, const char* what) {
  struct tm fields {};
  if (time == nullptr || ASN1_TIME_to_tm(time, &fields) != 1) {
    ERR_clear_error();
    throw CryptoException(std::string("Certificate has an invalid ") + what + " time");
  }
  int64_t seconds = static_cast<int64_t>(timegm(&fields));
  try {
    return System::DateTimeFromUtc(seconds * 1000000, false);
  } catch (const InvalidArgumentException&) {
    throw CryptoException(std::string("Certificate has a ") + what + " time out of range");
  }
}

}  // namespace Crypto
}  // namespace Tamber
