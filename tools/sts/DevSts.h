#ifndef TOOLS_STS_DEVSTS_H
#define TOOLS_STS_DEVSTS_H

// A development STS: a real WS-Trust 1.3 token service over HTTPS on loopback, for demos and
// end-to-end tests. It issues, renews and validates SAML 2.0 assertions signed with the key
// material of a key directory, for the users of its configuration.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "ssoClient/NegotiationHandler.h"

namespace DevSts {

// The PEM files of a key directory, by file name.
extern const char CA_CERTIFICATE_FILE[];      // "ca.pem": issues every certificate below
extern const char CA_KEY_FILE[];              // "ca.key"
extern const char SIGNING_CERTIFICATE_FILE[]; // "sts.pem": signs the tokens
extern const char SIGNING_KEY_FILE[];         // "sts.key"
extern const char TLS_CERTIFICATE_FILE[];     // "tls.pem": localhost, 127.0.0.1 and ::1
extern const char TLS_KEY_FILE[];             // "tls.key"
extern const char CLIENT_CERTIFICATE_FILE[];  // "client.pem": the default solution user's identity
extern const char CLIENT_KEY_FILE[];          // "client.key"

// Writes a fresh CA, token signer, TLS identity and client identity into `directory` (created
// when missing; existing files are replaced).
void GenerateKeys(const std::string& directory);

// A user who authenticates with a password.
struct User {
  std::string name;  // "alice@example.com"
  std::string password;
  std::string givenName;
  std::string surname;
  std::vector<std::string> groups;  // "example.com\\Users"
};

// A user who authenticates with a certificate (PEM); tokens say it is a solution.
struct SolutionUser {
  std::string name;
  std::string certificatePem;
  std::vector<std::string> groups;
};

struct Config {
  std::string keyDirectory;
  std::string address = "127.0.0.1";
  int port = 0;  // 0: an ephemeral port
  std::vector<User> users;
  std::vector<SolutionUser> solutionUsers;
  int64_t maxLifetimeSec = 8 * 3600;
  int64_t clockToleranceSec = 300;
};

// The built-in configuration over `keyDirectory`: users "alice@example.com" (password
// "alice-password") and "bob@example.com" ("bob-password"), and the solution user
// "demo-solution@example.com" holding the directory's client certificate.
Config DefaultConfig(const std::string& keyDirectory);
// The users of a JSON configuration file over `keyDirectory`; std::runtime_error saying what is
// wrong with the file.
Config LoadConfig(const std::string& jsonFile, const std::string& keyDirectory);

class Server {
 public:
  explicit Server(const Config& config);
  ~Server();  // stops
  Server(const Server&) = delete;
  Server& operator=(const Server&) = delete;

  // Listens and serves on threads of its own; returns once connections are accepted.
  void Start();
  // Stops serving and waits for the threads; idempotent.
  void Stop();
  int GetPort() const;
  // "https://127.0.0.1:PORT/sts/STSService"
  std::string GetUrl() const;

 private:
  struct Impl;
  std::unique_ptr<Impl> _impl;
};

// The caller's side of the STS's test GSS mechanism, for the SPNEGO operation: it authenticates
// `user` with `password` over two legs or more.
boost::shared_ptr<SsoClient::NegotiationHandler> CreateTestMechanismHandler(const std::string& user,
                                                                            const std::string& password);

}  // namespace DevSts

#endif
