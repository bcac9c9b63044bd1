#ifndef TESTS_TAMBER_CRYPTO_TESTKEYS_H
#define TESTS_TAMBER_CRYPTO_TESTKEYS_H

// The committed test keys and files (tests/data), read for the crypto and XML security suites.

#include <cstdio>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>

#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"

namespace TestKeys {

inline std::string DataPath(const std::string& relative) { return std::string(SSOCLIENT_TEST_DATA_DIR) + "/" + relative; }

inline std::string ReadDataFile(const std::string& relative) {
  std::ifstream in(DataPath(relative), std::ios::binary);
  if (!in) throw std::runtime_error("missing test file " + relative);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

// "sts" for tests/data/keys/sts.pem.
inline Tamber::Ref<const Tamber::Crypto::Certificate> Certificate(const std::string& name) {
  Tamber::Ref<const Tamber::Crypto::Certificate> certificate;
  Tamber::Crypto::CreateCertificateFromPem(ReadDataFile("keys/" + name + ".pem"), certificate);
  return certificate;
}

// "sts" for tests/data/keys/sts.key.
inline Tamber::Ref<const Tamber::Crypto::PrivateKey> PrivateKey(const std::string& name) {
  Tamber::Ref<const Tamber::Crypto::PrivateKey> key;
  Tamber::Crypto::CreatePrivateKeyFromPem(ReadDataFile("keys/" + name + ".key"), key);
  return key;
}

// Standard output of a shell command (an independent tool such as openssl or xmlsec1), and its
// exit status.
inline std::string RunCommand(const std::string& command, int& status) {
  std::string output;
  FILE* pipe = popen((command + " 2>&1").c_str(), "r");
  if (pipe == nullptr) throw std::runtime_error("cannot run " + command);
  char buffer[4096];
  size_t read;
  while ((read = fread(buffer, 1, sizeof buffer, pipe)) > 0) output.append(buffer, read);
  status = pclose(pipe);
  return output;
}

}  // namespace TestKeys

#endif
