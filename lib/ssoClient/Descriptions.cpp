#include "ssoClient/Descriptions.h"

#include <boost/algorithm/string/join.hpp>

#include "tamber/MessageFormatter.h"

namespace SsoClient {

using Tamber::MessageFormatter::ASPrint;
using Tamber::MessageFormatter::BoolPrintFormatter;
using Tamber::MessageFormatter::DatePrintFormatter;

namespace {

const char LIST_SEPARATOR[] = ", ";
const char UNSET[] = "<unset>";

}  // namespace

template <class T>
std::string AsString(const std::vector<T>& items, boost::function<std::string(const T*)> writer) {
  std::string text;
  for (const T& item : items) {
    // An empty description adds neither text nor separator, wherever it stands.
    const std::string description = writer(&item);
    if (description.empty()) continue;
    if (!text.empty()) text += LIST_SEPARATOR;
    text += description;
  }
  return text;
}

template std::string AsString<Delegate>(const std::vector<Delegate>&,
                                        boost::function<std::string(const Delegate*)>);
template std::string AsString<PrincipalId>(const std::vector<PrincipalId>&,
                                           boost::function<std::string(const PrincipalId*)>);
template std::string AsString<Advice>(const std::vector<Advice>&,
                                      boost::function<std::string(const Advice*)>);
template std::string AsString<AdviceAttribute>(const std::vector<AdviceAttribute>&,
                                               boost::function<std::string(const AdviceAttribute*)>);

std::string WriteTokenSpec(const TokenSpec& spec) {
  return ASPrint(
      "TokenSpec [tokenLifetimeSec=%1, delegable=%2, delegateTo=%3, renewable=%4, confirmationType=%5,"
      "audienceRestriction=%6, advice=[%7]",
      spec.tokenLifetimeSec, BoolPrintFormatter(spec.delegable), spec.delegateTo ? *spec.delegateTo : UNSET,
      BoolPrintFormatter(spec.renewable), static_cast<int>(spec.confirmation),
      boost::algorithm::join(spec.audienceRestriction, LIST_SEPARATOR),
      AsString<Advice>(spec.advice, &WriteAdvice));
}

std::string CreateRedactedDescription(const SamlToken& token) {
  std::vector<PrincipalId> groups;
  token.GetGroups(groups);
  std::vector<Delegate> delegationChain;
  token.GetDelegationChain(delegationChain);
  return ASPrint(
      "SamlToken [subject=%1, groups=[%2], delegationChain=[%3], startTime=%4, expirationTime=%5, "
      "renewable=%6, delegable=%7, isSolution=%8,confirmationType=%9]",
      token.GetSubject().ToString(), AsString<PrincipalId>(groups, &PrincipalId::ToString),
      AsString<Delegate>(delegationChain, &WriteDelegate), DatePrintFormatter(token.GetStartDate()),
      DatePrintFormatter(token.GetEndDate()), BoolPrintFormatter(token.IsRenewable()),
      BoolPrintFormatter(token.IsDelegable()), BoolPrintFormatter(token.IsSolution()),
      static_cast<int>(token.GetConfirmationMethod()));
}

std::string WriteDelegate(const Delegate* delegate) {
  return delegate->principal.ToString() + " at " + delegate->delegationInstant.ToString();
}

std::string WriteAdvice(const Advice* advice) {
  return ASPrint("Advice [source=%1, attributes=[%2]]", advice->source,
                 AsString<AdviceAttribute>(advice->attributes, &WriteAdviceAttribute));
}

std::string WriteAdviceAttribute(const AdviceAttribute* attribute) {
  return ASPrint("[source=%1, attributes=[%2]]", attribute->name,
                 boost::algorithm::join(attribute->values, LIST_SEPARATOR));
}

}  // namespace SsoClient
