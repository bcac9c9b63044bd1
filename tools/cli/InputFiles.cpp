#include "InputFiles.h"

#include <fstream>
#include <sstream>

#include "ExitCodes.h"
#include "tamber/Exception.h"

namespace Cli {
namespace {

CliError FileError(const std::string& path, const std::string& problem) {
  return CliError("FileError", EXIT_CODE_USAGE, "file '" + path + "': " + problem);
}

}  // namespace

std::string ReadTextFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  if (!in) throw FileError(path, "cannot be opened for reading");
  std::ostringstream text;
  text << in.rdbuf();
  if (in.bad()) throw FileError(path, "cannot be read");
  return text.str();
}

SsoClient::CertificateList LoadCertificates(const std::vector<std::string>& paths) {
  SsoClient::CertificateList result;
  for (const std::string& path : paths) {
    std::vector<Tamber::Ref<const Tamber::Crypto::Certificate>> certificates;
    try {
      Tamber::Crypto::CreateCertificatesFromPem(ReadTextFile(path), certificates);
    } catch (const Tamber::Crypto::CryptoException& e) {
      throw FileError(path, std::string("expected PEM certificates: ") + e.what());
    }
    result.insert(result.end(), certificates.begin(), certificates.end());
  }
  return result;
}

boost::optional<SsoClient::HolderOfKeyConfig> LoadHolderOfKey(const std::string& certificatePath,
                                                              const std::string& keyPath) {
  if (certificatePath.empty() && keyPath.empty()) return boost::none;
  if (certificatePath.empty() || keyPath.empty()) {
    throw CliError("UsageError", EXIT_CODE_USAGE, "--cert and --key must be given together");
  }
  SsoClient::HolderOfKeyConfig config;
  try {
    Tamber::Crypto::CreateCertificateFromPem(ReadTextFile(certificatePath), config.certificate);
  } catch (const Tamber::Crypto::CryptoException& e) {
    throw FileError(certificatePath, std::string("expected a PEM certificate: ") + e.what());
  }
  try {
    Tamber::Crypto::CreatePrivateKeyFromPem(ReadTextFile(keyPath), config.privateKey);
  } catch (const Tamber::Crypto::CryptoException& e) {
    throw FileError(keyPath, std::string("expected an unencrypted PEM private key: ") + e.what());
  }
  if (!config.privateKey->Matches(*config.certificate)) {
    throw FileError(keyPath, "the key does not match the certificate of '" + certificatePath + "'");
  }
  return config;
}

}  // namespace Cli
