#ifndef TOOLS_STS_CERTIFICATETRUST_H
#define TOOLS_STS_CERTIFICATETRUST_H

// Whether a client certificate was issued by the key directory's CA, and whom it names.

#include <string>

#include "tamber/crypto/Certificate.h"

namespace DevSts {

// True when `certificate` chains to `ca` and may authenticate a client now.
bool IsClientCertificateOf(const Tamber::Crypto::Certificate& certificate, const Tamber::Crypto::Certificate& ca);
// The common name of the certificate's subject; empty when it has none.
std::string CommonNameOf(const Tamber::Crypto::Certificate& certificate);

}  // namespace DevSts

#endif
