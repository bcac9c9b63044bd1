#include "TokenFacts.h"

#include <boost/algorithm/string/join.hpp>
#include <iomanip>
#include <set>
#include <utility>
#include <vector>

namespace Cli {
namespace {

using nlohmann::json;

// "name@domain".
std::string FormatPrincipal(const SsoClient::PrincipalId& principal) { return principal.name + "@" + principal.domain; }

// "bearer" or "holder-of-key".
std::string FormatConfirmation(const SsoClient::SamlToken& token) {
  return token.GetConfirmationMethod() == SsoClient::SamlToken::CONFIRM_HOLDER_OF_KEY ? "holder-of-key" : "bearer";
}

std::vector<std::string> Groups(const SsoClient::SamlToken& token) {
  std::vector<SsoClient::PrincipalId> groups;
  token.GetGroups(groups);
  std::vector<std::string> result;
  for (const SsoClient::PrincipalId& group : groups) result.push_back(group.domain + "\\" + group.name);
  return result;
}

std::vector<std::string> DelegationChain(const SsoClient::SamlToken& token) {
  std::vector<SsoClient::Delegate> chain;
  token.GetDelegationChain(chain);
  std::vector<std::string> result;
  for (const SsoClient::Delegate& delegate : chain) {
    result.push_back(FormatPrincipal(delegate.principal) + " at " + delegate.delegationInstant.ToString());
  }
  return result;
}

std::vector<std::string> Audience(const SsoClient::SamlToken& token) {
  std::set<std::string> audience;
  token.GetAudience(audience);
  return std::vector<std::string>(audience.begin(), audience.end());
}

json PrincipalJson(const SsoClient::PrincipalId& principal) {
  return json{{"name", principal.name}, {"domain", principal.domain}};
}

json ConfirmationJson(const SsoClient::SamlToken& token) {
  json confirmation{{"method", FormatConfirmation(token)}};
  if (const Tamber::Crypto::Certificate* certificate = token.GetConfirmationCertificate()) {
    confirmation["certificate"] = {{"subject", certificate->GetSubjectName()},
                                   {"sha256", certificate->GetSha256Thumbprint()}};
  }
  return confirmation;
}

json AdviceJson(const SsoClient::SamlToken& token) {
  std::vector<SsoClient::Advice> advice;
  token.GetAdvice(advice);
  json result = json::array();
  for (const SsoClient::Advice& entry : advice) {
    json attributes = json::array();
    for (const SsoClient::AdviceAttribute& attribute : entry.attributes) {
      attributes.push_back({{"name", attribute.name}, {"values", attribute.values}});
    }
    result.push_back({{"source", entry.source}, {"attributes", attributes}});
  }
  return result;
}

std::string ListOrNone(const std::vector<std::string>& items) {
  return items.empty() ? "(none)" : boost::algorithm::join(items, ", ");
}

std::string FullName(const SsoClient::SamlToken& token) {
  std::pair<std::string, std::string> fullName;
  token.GetFullName(fullName);
  std::vector<std::string> parts;
  if (!fullName.first.empty()) parts.push_back(fullName.first);
  if (!fullName.second.empty()) parts.push_back(fullName.second);
  return parts.empty() ? "(none)" : boost::algorithm::join(parts, " ");
}

const char* YesNo(bool value) { return value ? "yes" : "no"; }

}  // namespace

std::string TokenSummary(const SsoClient::SamlToken& token) {
  std::string summary = "subject " + FormatPrincipal(token.GetSubject()) + "; groups " + ListOrNone(Groups(token)) +
                        "; valid " + token.GetStartDate().ToString() + " to " + token.GetEndDate().ToString() + "; " +
                        FormatConfirmation(token);
  const std::vector<std::string> chain = DelegationChain(token);
  if (!chain.empty()) summary += "; delegated by " + ListOrNone(chain);
  return summary;
}

json TokenFactsJson(const SsoClient::SamlToken& token) {
  std::pair<std::string, std::string> fullName;
  token.GetFullName(fullName);
  std::vector<SsoClient::PrincipalId> groups;
  token.GetGroups(groups);
  std::vector<SsoClient::Delegate> chain;
  token.GetDelegationChain(chain);

  json groupList = json::array();
  for (const SsoClient::PrincipalId& group : groups) groupList.push_back(PrincipalJson(group));
  json chainList = json::array();
  for (const SsoClient::Delegate& delegate : chain) {
    json link = PrincipalJson(delegate.principal);
    link["delegationInstant"] = delegate.delegationInstant.ToString();
    chainList.push_back(link);
  }
  return json{
      {"id", token.GetId()},
      {"subject", PrincipalJson(token.GetSubject())},
      {"fullName", {{"givenName", fullName.first}, {"surname", fullName.second}}},
      {"solution", token.IsSolution()},
      {"groups", groupList},
      {"validity", {{"notBefore", token.GetStartDate().ToString()}, {"notOnOrAfter", token.GetEndDate().ToString()}}},
      {"confirmation", ConfirmationJson(token)},
      {"renewable", token.IsRenewable()},
      {"delegable", token.IsDelegable()},
      {"delegationChain", chainList},
      {"audience", Audience(token)},
      {"advice", AdviceJson(token)},
  };
}

void WriteTokenFacts(std::ostream& out, const SsoClient::SamlToken& token, const std::string& indent) {
  std::string confirmation = FormatConfirmation(token);
  if (const Tamber::Crypto::Certificate* certificate = token.GetConfirmationCertificate()) {
    confirmation += " (" + certificate->GetSubjectName() + ", sha256 " + certificate->GetSha256Thumbprint() + ")";
  }
  std::vector<SsoClient::Advice> advice;
  token.GetAdvice(advice);
  std::vector<std::string> adviceSources;
  for (const SsoClient::Advice& entry : advice) adviceSources.push_back(entry.source);

  const std::vector<std::pair<std::string, std::string>> facts = {
      {"id", token.GetId()},
      {"subject", FormatPrincipal(token.GetSubject())},
      {"full name", FullName(token)},
      {"solution", YesNo(token.IsSolution())},
      {"groups", ListOrNone(Groups(token))},
      {"valid from", token.GetStartDate().ToString()},
      {"valid until", token.GetEndDate().ToString()},
      {"confirmation", confirmation},
      {"renewable", YesNo(token.IsRenewable())},
      {"delegable", YesNo(token.IsDelegable())},
      {"delegation chain", ListOrNone(DelegationChain(token))},
      {"audience", ListOrNone(Audience(token))},
      {"advice", ListOrNone(adviceSources)},
  };
  for (const auto& fact : facts) {
    out << indent << std::left << std::setw(18) << (fact.first + ":") << fact.second << "\n";
  }
}

}  // namespace Cli
