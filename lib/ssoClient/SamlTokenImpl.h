#ifndef SSOCLIENT_SAMLTOKENIMPL_H
#define SSOCLIENT_SAMLTOKENIMPL_H

#include <set>
#include <string>
#include <utility>
#include <vector>

#include <boost/scoped_ptr.hpp>

#include "ssoClient/SamlAssertion.h"
#include "ssoClient/SamlToken.h"
#include "tamber/xml/security/Signature.h"

namespace SsoClient {

// A validated token. It exists only fully built: every check runs in the constructor, and any
// failure throws out of it.
class SamlTokenImpl final : public SamlToken {
 public:
  // Parses `xml` and validates its root element; ToXml() returns `xml` as given.
  SamlTokenImpl(const std::string& xml, Tamber::Xml::Security::KeyInfoResolver* resolver,
                long long clockToleranceSec);
  // Validates `element`; ToXml() returns its canonical form, taken before any check.
  SamlTokenImpl(Tamber::Xml::ElementNode* element, Tamber::Xml::Security::KeyInfoResolver* resolver,
                long long clockToleranceSec);

  const std::string& GetId() const override { return _id; }
  const Tamber::System::DateTime& GetStartDate() const override { return _startDate; }
  const Tamber::System::DateTime& GetEndDate() const override { return _endDate; }
  const PrincipalId& GetSubject() const override { return *_subject; }
  bool IsRenewable() const override { return _isRenewable; }
  bool IsDelegable() const override { return _isDelegable; }
  bool IsSolution() const override { return _isSolution; }
  ConfirmationType GetConfirmationMethod() const override { return _confirmationMethod; }
  void GetFullName(std::pair<std::string, std::string>& fullName) const override { fullName = _fullName; }
  void GetGroups(std::vector<PrincipalId>& groups) const override { groups = _groups; }
  void GetDelegationChain(std::vector<Delegate>& chain) const override { chain = _delegationChain; }
  void GetAudience(std::set<std::string>& audience) const override { audience = _audience; }
  void GetAdvice(std::vector<Advice>& advice) const override { advice = _advice; }
  const Tamber::Crypto::Certificate* GetConfirmationCertificate() const override {
    return _confirmationCertificate.get();
  }
  const std::string& ToXml() const override { return _xml; }

 private:
  void InitializeFromDom(Tamber::Xml::ElementNode* element, Tamber::Xml::Security::KeyInfoResolver* resolver,
                         long long clockToleranceSec);
  void PopulateTokenAttribute(const AttributeType& attribute);

  std::string _xml;
  std::string _id;
  Tamber::System::DateTime _startDate;
  Tamber::System::DateTime _endDate;
  boost::scoped_ptr<PrincipalId> _subject;
  bool _isRenewable = false;
  bool _isDelegable = false;
  bool _isSolution = false;
  std::pair<std::string, std::string> _fullName;
  std::vector<PrincipalId> _groups;
  std::vector<Delegate> _delegationChain;
  std::set<std::string> _audience;
  std::vector<Advice> _advice;
  ConfirmationType _confirmationMethod = CONFIRM_BEARER;
  Tamber::Ref<const Tamber::Crypto::Certificate> _confirmationCertificate;
};

// The version, id, validity window (widened by the tolerance on both sides), bearer subject
// validity and delegation rules of a parsed assertion; the clock is read once.
void CheckTokenProperties(const SamlAssertionType& assertion, long long clockToleranceSec);
// Verifies the signature with the resolver's keys, and that what it verified is the assertion
// itself. Raises InvalidSignatureException, or ParseException when it covers something else.
void ValidateSignature(Tamber::Xml::Security::Signature* signature, Tamber::Xml::Security::KeyInfoResolver* resolver,
                       const Tamber::Xml::ElementNode* assertion);

}  // namespace SsoClient

#endif
