#include "ssoClient/SamlTokenImpl.h"

#include <algorithm>
#include <cstdint>

#include "ssoClient/Exceptions.h"
#include "ssoClient/SamlTokenAttributes.h"
#include "ssoClient/SignatureAlgorithms.h"
#include "tamber/Panic.h"
#include "tamber/Stream.h"
#include "tamber/xml/security/Canonicalizer.h"

using Tamber::Xml::ElementNode;
using Tamber::Xml::Security::KeyInfoResolver;
using Tamber::Xml::Security::Signature;

namespace SsoClient {

namespace {

const long long DEFAULT_CLOCK_TOLERANCE_SEC = 600;

// Instants and tolerances saturate instead of overflowing, so that a huge tolerance simply
// opens the window as far as it goes.
int64_t SaturatingAdd(int64_t a, int64_t b) {
  int64_t sum;
  if (!__builtin_add_overflow(a, b, &sum)) return sum;
  return b > 0 ? INT64_MAX : INT64_MIN;
}

int64_t SaturatingSub(int64_t a, int64_t b) {
  int64_t difference;
  if (!__builtin_sub_overflow(a, b, &difference)) return difference;
  return b > 0 ? INT64_MIN : INT64_MAX;
}

int64_t ToleranceMicros(long long clockToleranceSec) {
  int64_t micros;
  if (!__builtin_mul_overflow(static_cast<int64_t>(clockToleranceSec), int64_t{1000000}, &micros)) return micros;
  return clockToleranceSec > 0 ? INT64_MAX : INT64_MIN;
}

void CheckDelegation(const SubjectConfirmationType& confirmation,
                     const boost::optional<DelegationRestrictionType>& restriction) {
  if (confirmation.nameId && !restriction) {
    throw ParseException("Token SubjectConfirmation contains delegate id, but no delegation restriction is present");
  }
  if (confirmation.nameId) {
    const NameIDType& last = restriction->delegate.back().nameId;
    if (confirmation.nameId->format != last.format || confirmation.nameId->value != last.value) {
      throw ParseException("The SubjectConfirmation delegate id does not match the id of the last delegate");
    }
  } else if (restriction) {
    throw ParseException("Token has delegation restriction, but no delegate id is present in the SubjectConfirmation");
  }
}

template <class Source>
boost::shared_ptr<const SamlToken> CreateToken(Source source, const CertificateList& certificates,
                                               long long clockToleranceSec) {
  Tamber::Ref<KeyInfoResolver> resolver;
  Tamber::Xml::Security::CreateTrustChainKeyResolver(certificates, resolver);
  return boost::shared_ptr<const SamlToken>(new SamlTokenImpl(source, resolver.get(), clockToleranceSec));
}

}  // namespace

SamlTokenImpl::SamlTokenImpl(const std::string& xml, KeyInfoResolver* resolver, long long clockToleranceSec)
    : _xml(xml) {
  Tamber::Ref<Tamber::Xml::Document> document;
  ParseXML(_xml, document);
  InitializeFromDom(document->GetRootElement(), resolver, clockToleranceSec);
  TAMBER_VERIFY_TEXT(_subject, "_subject");
}

SamlTokenImpl::SamlTokenImpl(ElementNode* element, KeyInfoResolver* resolver, long long clockToleranceSec) {
  Tamber::Ref<Tamber::Xml::Security::Canonicalizer> canonicalizer;
  Tamber::Xml::Security::CreateCanonicalizer(Algorithms::C14N_CANONICALIZER_ID, canonicalizer);
  Tamber::Ref<Tamber::StringWriter> writer;
  Tamber::CreateStringWriter(writer);
  canonicalizer->Canonicalize(element, writer.get());
  _xml = writer->GetString();
  InitializeFromDom(element, resolver, clockToleranceSec);
  TAMBER_VERIFY_TEXT(_subject, "_subject");
}

void SamlTokenImpl::InitializeFromDom(ElementNode* element, KeyInfoResolver* resolver, long long clockToleranceSec) {
  const boost::shared_ptr<const NodeFilter> filter(new SkipWsAndCommentsFilter());
  NodeFilterIterator it(element, filter);
  SamlAssertionType assertion;
  ParseSamlAssertionElement(it, assertion);
  CheckTokenProperties(assertion, clockToleranceSec);
  ValidateSignature(assertion.signature.get(), resolver, element);

  _id = assertion.id;
  _subject.reset(new PrincipalId(ParseSamlNameId(assertion.subject.nameId)));
  const ConditionsType& conditions = assertion.conditions;
  _startDate = conditions.notBefore;
  _endDate = conditions.notOnOrAfter;
  const SubjectConfirmationType& confirmation = assertion.subject.subjectConfirmation;
  _confirmationMethod = confirmation.method;
  _confirmationCertificate = confirmation.subjectConfirmationData.certificate;
  _isRenewable = conditions.renewRestriction && conditions.renewRestriction->count &&
                 *conditions.renewRestriction->count > 0;
  _isDelegable = conditions.proxyRestriction && conditions.proxyRestriction->count &&
                 *conditions.proxyRestriction->count > 0;
  if (assertion.advice) _advice = assertion.advice->advice;
  if (assertion.attributeStatement) {
    for (const AttributeType& attribute : assertion.attributeStatement->attribute) PopulateTokenAttribute(attribute);
  }
  if (conditions.delegationRestriction) {
    for (const DelegateType& delegate : conditions.delegationRestriction->delegate) {
      _delegationChain.push_back(ParseToDelegate(delegate));
    }
  }
  if (conditions.audienceRestriction) _audience = conditions.audienceRestriction->audience;
}

void ParseTokenSignature(NodeFilterIterator& it, ElementNode* assertion, Tamber::Ref<Signature>& signature) {
  ElementNode* signatureElement = IteratorToElement(it);
  if (signatureElement == nullptr) throw ParseException("Expected element ds:Signature not found");
  try {
    Tamber::Xml::Security::CreateSignatureFromDom(assertion, signatureElement, signature);
  } catch (const Tamber::Xml::Security::XmlSecurityException& e) {
    // Syntax errors, and any other failure to read the signature, are a malformed token.
    throw ParseException(std::string("Signature syntax error: ") + e.what());
  }

  std::string id;
  assertion->GetAttribute("ID", id);
  const std::string ownReference = "#" + id;
  const auto& references = signature->GetReferences();
  const bool coversToken = std::any_of(references.begin(), references.end(), [&](const auto& reference) {
    return reference->GetURI().empty() || reference->GetURI() == ownReference;
  });
  if (!coversToken) throw ParseException("Token's signature must cover the entire token");
  it.MoveToSibling();
}

void CheckTokenProperties(const SamlAssertionType& assertion, long long clockToleranceSec) {
  if (assertion.version != "2.0") throw ParseException("Invalid token version");
  if (assertion.id.empty() || assertion.id[0] != '_') throw ParseException("Invalid token ID");

  const ConditionsType& conditions = assertion.conditions;
  if (!(conditions.notBefore.GetUtcTime() < conditions.notOnOrAfter.GetUtcTime())) {
    throw ParseException("Unsatisfiable token validity conditions: NotBefore must be less than NotOnOrAfter.");
  }
  const int64_t tolerance = ToleranceMicros(clockToleranceSec);
  const int64_t now = Tamber::System::GetUtcDateTime().GetUtcTime();
  if (SaturatingSub(conditions.notBefore.GetUtcTime(), tolerance) > now) {
    throw ParseException("Token start date is in the future: " + conditions.notBefore.ToString());
  }
  if (SaturatingAdd(conditions.notOnOrAfter.GetUtcTime(), tolerance) <= now) {
    throw ParseException("The token has expired at: " + conditions.notOnOrAfter.ToString());
  }

  const SubjectConfirmationType& confirmation = assertion.subject.subjectConfirmation;
  if (confirmation.method == SamlToken::CONFIRM_BEARER &&
      confirmation.subjectConfirmationData.notOnOrAfter.GetUtcTime() < conditions.notOnOrAfter.GetUtcTime()) {
    throw ParseException("Invalid token subject validity");
  }
  CheckDelegation(confirmation, conditions.delegationRestriction);
}

void ValidateSignature(Signature* signature, KeyInfoResolver* resolver, const ElementNode* assertion) {
  std::vector<ElementNode*> verifiedElements;
  bool valid;
  try {
    valid = signature->Verify(resolver, verifiedElements);
  } catch (const Tamber::Xml::Security::XmlSecurityException& e) {
    throw InvalidSignatureException(std::string("Signature verification error. ") + e.what());
  } catch (const Tamber::Crypto::CryptoException& e) {
    // A certificate in the signature's own KeyInfo that cannot be read.
    throw InvalidSignatureException(std::string("Signature verification error. ") + e.what());
  }
  if (!valid) throw InvalidSignatureException("Failed to verify signature: token might have been tampered with.");
  // The reference named the assertion's ID; it must also have resolved to the assertion itself
  // and not to another element carrying the same ID (signature wrapping).
  if (std::find(verifiedElements.begin(), verifiedElements.end(), assertion) == verifiedElements.end()) {
    throw ParseException("Token's signature must cover the entire token");
  }
}

boost::shared_ptr<const SamlToken> CreateSamlToken(const std::string& xml, const CertificateList& certificates,
                                                   long long clockToleranceSec) {
  return CreateToken<const std::string&>(xml, certificates, clockToleranceSec);
}

boost::shared_ptr<const SamlToken> CreateSamlToken(const std::string& xml, const CertificateList& certificates) {
  return CreateSamlToken(xml, certificates, DEFAULT_CLOCK_TOLERANCE_SEC);
}

boost::shared_ptr<const SamlToken> CreateSamlToken(const std::string& xml,
                                                   const Tamber::Crypto::Certificate* certificate) {
  if (certificate == nullptr) throw Tamber::InvalidArgumentException("the trusted certificate must not be null");
  return CreateSamlToken(xml, CertificateList{Tamber::Ref<const Tamber::Crypto::Certificate>(certificate)});
}

boost::shared_ptr<const SamlToken> CreateSamlTokenFromDom(ElementNode* element, const CertificateList& certificates,
                                                          long long clockToleranceSec) {
  if (element == nullptr) throw Tamber::InvalidArgumentException("the token element must not be null");
  return CreateToken<ElementNode*>(element, certificates, clockToleranceSec);
}

boost::shared_ptr<const SamlToken> CreateSamlTokenFromDom(ElementNode* element, const CertificateList& certificates) {
  return CreateSamlTokenFromDom(element, certificates, DEFAULT_CLOCK_TOLERANCE_SEC);
}

}  // namespace SsoClient
