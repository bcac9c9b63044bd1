#include <filesystem>
#include <stdexcept>

#include <nlohmann/json.hpp>

#include "DevSts.h"
#include "KeyDirectory.h"

namespace DevSts {

namespace {

using Json = nlohmann::json;

std::vector<std::string> Groups(const Json& entry) {
  return entry.contains("groups") ? entry.at("groups").get<std::vector<std::string>>() : std::vector<std::string>();
}

}  // namespace

Config DefaultConfig(const std::string& keyDirectory) {
  Config config;
  config.keyDirectory = keyDirectory;
  config.users = {{"alice@example.com", "alice-password", "Alice", "Example", {"example.com\\Users"}},
                  {"bob@example.com", "bob-password", "Bob", "Example", {"example.com\\Users", "example.com\\Admins"}}};
  config.solutionUsers = {{"demo-solution@example.com", ReadTextFile(KeyPath(keyDirectory, CLIENT_CERTIFICATE_FILE)),
                           {"example.com\\SolutionUsers"}}};
  return config;
}

// {"users": [{"name", "password", "givenName"?, "surname"?, "groups"?}],
//  "solutionUsers": [{"name", "certificate"?: PEM file, relative to the configuration file,
//                     the key directory's client certificate when absent, "groups"?}],
//  "maxLifetimeSec"?, "clockToleranceSec"?}
Config LoadConfig(const std::string& jsonFile, const std::string& keyDirectory) {
  Config config;
  config.keyDirectory = keyDirectory;
  try {
    const Json json = Json::parse(ReadTextFile(jsonFile));
    for (const Json& entry : json.value("users", Json::array())) {
      config.users.push_back({entry.at("name").get<std::string>(), entry.at("password").get<std::string>(),
                              entry.value("givenName", ""), entry.value("surname", ""), Groups(entry)});
    }
    const std::filesystem::path base = std::filesystem::path(jsonFile).parent_path();
    for (const Json& entry : json.value("solutionUsers", Json::array())) {
      const std::string certificate = entry.contains("certificate")
                                          ? (base / entry.at("certificate").get<std::string>()).string()
                                          : KeyPath(keyDirectory, CLIENT_CERTIFICATE_FILE);
      config.solutionUsers.push_back({entry.at("name").get<std::string>(), ReadTextFile(certificate), Groups(entry)});
    }
    config.maxLifetimeSec = json.value("maxLifetimeSec", config.maxLifetimeSec);
    config.clockToleranceSec = json.value("clockToleranceSec", config.clockToleranceSec);
  } catch (const Json::exception& e) {
    throw std::runtime_error(jsonFile + ": " + e.what());
  }
  if (config.users.empty() && config.solutionUsers.empty()) {
    throw std::runtime_error(jsonFile + ": expected \"users\" or \"solutionUsers\", found neither");
  }
  return config;
}

}  // namespace DevSts
