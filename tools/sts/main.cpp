// ssoclient-sts: the development STS on loopback, until SIGINT or SIGTERM.

#include <csignal>
#include <filesystem>
#include <iostream>

#include <CLI/CLI.hpp>

#include "DevSts.h"
#include "KeyDirectory.h"

int main(int argc, char** argv) {
  CLI::App app("A development WS-Trust STS over HTTPS on loopback, issuing SAML 2.0 tokens.");
  std::string generateDirectory;
  std::string keyDirectory = SSOCLIENT_STS_DEFAULT_KEYS;
  std::string configFile;
  DevSts::Config options;
  options.port = 8443;
  app.add_option("--generate", generateDirectory, "Write fresh keys into DIR and exit")->option_text("DIR");
  app.add_option("--keys", keyDirectory, "Key directory; generated when it holds no keys")
      ->option_text("DIR")
      ->capture_default_str();
  app.add_option("--config", configFile, "Users and solution users (JSON)")->option_text("FILE")->check(
      CLI::ExistingFile);
  app.add_option("--address", options.address, "Loopback address to listen on")->capture_default_str();
  app.add_option("--port", options.port, "Port to listen on (0: any free port)")
      ->check(CLI::Range(0, 65535))
      ->capture_default_str();
  CLI11_PARSE(app, argc, argv);

  try {
    if (!generateDirectory.empty()) {
      DevSts::GenerateKeys(generateDirectory);
      std::cout << "Keys written to " << generateDirectory << std::endl;
      return 0;
    }
    if (!std::filesystem::exists(DevSts::KeyPath(keyDirectory, DevSts::SIGNING_KEY_FILE))) {
      DevSts::GenerateKeys(keyDirectory);
      std::cout << "Generated keys in " << keyDirectory << std::endl;
    }
    DevSts::Config config =
        configFile.empty() ? DevSts::DefaultConfig(keyDirectory) : DevSts::LoadConfig(configFile, keyDirectory);
    config.address = options.address;
    config.port = options.port;

    // Blocked before the server's threads start, so that they inherit the mask and the
    // signals reach sigwait below.
    sigset_t stopSignals;
    sigemptyset(&stopSignals);
    sigaddset(&stopSignals, SIGINT);
    sigaddset(&stopSignals, SIGTERM);
    // A client that hangs up mid-answer must not end the server.
    signal(SIGPIPE, SIG_IGN);
    pthread_sigmask(SIG_BLOCK, &stopSignals, nullptr);

    DevSts::Server server(config);
    server.Start();
    std::cout << "Dev STS listening on " << server.GetUrl() << std::endl
              << "Trust " << DevSts::KeyPath(keyDirectory, DevSts::CA_CERTIFICATE_FILE) << " for TLS and "
              << DevSts::KeyPath(keyDirectory, DevSts::SIGNING_CERTIFICATE_FILE) << " for tokens" << std::endl;
    int signal = 0;
    sigwait(&stopSignals, &signal);
    server.Stop();
    std::cout << "Stopped" << std::endl;
  } catch (const std::exception& e) {
    std::cerr << "ssoclient-sts: " << e.what() << std::endl;
    return 1;
  }
  return 0;
}
