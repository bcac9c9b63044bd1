#include "ssoClient/SamlTokenAttributes.h"

#include <boost/algorithm/string/predicate.hpp>

#include "ssoClient/Exceptions.h"
#include "ssoClient/SamlConstants.h"
#include "ssoClient/SamlTokenImpl.h"

namespace SsoClient {

PrincipalId ParseSamlNameId(const NameIDType& nameId) {
  if (nameId.format != Saml::UPN_FORMAT) {
    throw ParseException("Invalid or unsupported NameId format '" + nameId.format + "'");
  }
  const std::string& value = nameId.value;
  const std::string::size_type at = value.rfind('@');
  if (at == std::string::npos || at == 0 || at == value.size() - 1) {
    throw ParseException("Failed to parse the UPN NameID: `" + value + "'; name or domain part is missing.");
  }
  return PrincipalId(value.substr(0, at), value.substr(at + 1));
}

Delegate ParseToDelegate(const DelegateType& delegate) {
  return Delegate{ParseSamlNameId(delegate.nameId), delegate.delegationInstant};
}

bool SamlAttributeIsGroupIdentity(const AttributeType& attribute) {
  return attribute.name == Saml::ATTRIBUTE_GROUP_IDENTITY;
}

bool SamlAttributeIsSolution(const AttributeType& attribute) { return attribute.name == Saml::ATTRIBUTE_IS_SOLUTION; }

bool SamlAttributeIsGivenName(const AttributeType& attribute) { return attribute.name == Saml::ATTRIBUTE_GIVEN_NAME; }

bool SamlAttributeIsSurName(const AttributeType& attribute) { return attribute.name == Saml::ATTRIBUTE_SURNAME; }

std::string ParsePrincipalNameAttribute(const AttributeType& attribute) {
  return attribute.attributeValue.empty() ? std::string() : attribute.attributeValue.front();
}

bool ParseIsSolutionAttribute(const AttributeType& attribute) {
  if (attribute.attributeValue.empty()) throw ParseException("No value found for attribute isSolution.");
  if (attribute.attributeValue.size() > 1) {
    throw ParseException("More than one value found for attribute isSolution.");
  }
  return boost::algorithm::iequals(attribute.attributeValue.front(), "true");
}

void SamlTokenImpl::PopulateTokenAttribute(const AttributeType& attribute) {
  if (SamlAttributeIsGroupIdentity(attribute)) {
    for (const std::string& value : attribute.attributeValue) _groups.push_back(ParseGroupIdentity(value));
  } else if (SamlAttributeIsSolution(attribute)) {
    _isSolution = ParseIsSolutionAttribute(attribute);
  } else if (SamlAttributeIsGivenName(attribute)) {
    _fullName.first = ParsePrincipalNameAttribute(attribute);
  } else if (SamlAttributeIsSurName(attribute)) {
    _fullName.second = ParsePrincipalNameAttribute(attribute);
  }
}

}  // namespace SsoClient
