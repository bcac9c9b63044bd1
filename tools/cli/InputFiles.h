#ifndef TOOLS_CLI_INPUTFILES_H
#define TOOLS_CLI_INPUTFILES_H

// Files named on the command line: tokens, certificates and keys. A file that cannot be read or
// does not hold what is expected is a usage error naming the file.

#include <boost/optional.hpp>
#include <string>
#include <vector>

#include "ssoClient/SamlToken.h"
#include "ssoClient/TokenSpec.h"
#include "tamber/Ref.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"

namespace Cli {

std::string ReadTextFile(const std::string& path);
// Every certificate of every file, in order.
SsoClient::CertificateList LoadCertificates(const std::vector<std::string>& paths);
// The holder-of-key identity of a certificate file and its key file: both or neither given,
// and the key must match the certificate.
boost::optional<SsoClient::HolderOfKeyConfig> LoadHolderOfKey(const std::string& certificatePath,
                                                              const std::string& keyPath);

}  // namespace Cli

#endif
