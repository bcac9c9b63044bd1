#ifndef TOOLS_STS_KEYDIRECTORY_H
#define TOOLS_STS_KEYDIRECTORY_H

// Files of a key directory.

#include <string>

#include "tamber/Ref.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"

namespace DevSts {

// `directory`/`fileName`.
std::string KeyPath(const std::string& directory, const std::string& fileName);
// The whole content of a file; std::runtime_error naming the file when it cannot be read.
std::string ReadTextFile(const std::string& path);
// `pem` decoded; std::runtime_error "`expected`: <reason>" when it holds no such object.
Tamber::Ref<const Tamber::Crypto::Certificate> ParseCertificatePem(const std::string& pem,
                                                                   const std::string& expected);
Tamber::Ref<const Tamber::Crypto::PrivateKey> ParsePrivateKeyPem(const std::string& pem, const std::string& expected);
Tamber::Ref<const Tamber::Crypto::Certificate> ReadCertificate(const std::string& path);
Tamber::Ref<const Tamber::Crypto::PrivateKey> ReadPrivateKey(const std::string& path);

}  // namespace DevSts

#endif
