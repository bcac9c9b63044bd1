// Writes the token vectors of tests/data/tokens: valid tokens issued by the token issuer and
// their negative twins, each with a single defect. Run by tests/data/tokens/generate.sh, which
// adds the tokens signed by the xmlsec1 command-line tool.
//
// Usage: generate_test_tokens KEYS_DIR OUTPUT_DIR

#include <cstdlib>
#include <fstream>
#include <iostream>
#include <sstream>
#include <string>

#include "TokenIssuer.h"
#include "tamber/StringUtil.h"

using Tamber::Ref;
using Tamber::System::DateTime;
using TokenIssuer::TokenRecord;

namespace {

// Every vector is issued at this instant and valid for one hour; the tests fix their clock
// half-way through.
const char ISSUE_INSTANT[] = "2027-06-01T10:00:00Z";

struct Signer {
  Ref<const Tamber::Crypto::PrivateKey> key;
  Ref<const Tamber::Crypto::Certificate> certificate;
};

std::string ReadFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  if (!in) {
    std::cerr << "cannot read " << path << "\n";
    std::exit(1);
  }
  std::ostringstream content;
  content << in.rdbuf();
  return content.str();
}

Signer LoadSigner(const std::string& keysDir, const std::string& name) {
  Signer signer;
  Tamber::Crypto::CreatePrivateKeyFromPem(ReadFile(keysDir + "/" + name + ".key"), signer.key);
  Tamber::Crypto::CreateCertificateFromPem(ReadFile(keysDir + "/" + name + ".pem"), signer.certificate);
  return signer;
}

// Replaces the one occurrence of `from`; a vector whose edit found nothing to edit is a bug.
std::string ReplaceOnce(const std::string& text, const std::string& from, const std::string& to) {
  const std::string::size_type at = text.find(from);
  if (at == std::string::npos || text.find(from, at + 1) != std::string::npos) {
    std::cerr << "expected exactly one occurrence of: " << from << "\n";
    std::exit(1);
  }
  return text.substr(0, at) + to + text.substr(at + from.size());
}

// The text from `begin` up to and including `end`.
std::string Excerpt(const std::string& text, const std::string& begin, const std::string& end) {
  const std::string::size_type from = text.find(begin);
  const std::string::size_type to = text.find(end, from);
  if (from == std::string::npos || to == std::string::npos) {
    std::cerr << "no excerpt " << begin << " ... " << end << "\n";
    std::exit(1);
  }
  return text.substr(from, to + end.size() - from);
}

std::string Base64Der(const Tamber::Crypto::Certificate& certificate) {
  return Tamber::StringUtil::Base64Encode(certificate.GetDer());
}

TokenRecord BearerRecord() {
  TokenRecord record;
  record.id = "_bearer-token";
  return record;
}

// A realistic holder-of-key token: ten groups, names, advice, audience, renewable, delegable.
TokenRecord HolderOfKeyRecord(const Signer& client) {
  TokenRecord record;
  record.id = "_holder-of-key-token";
  record.confirmation = SsoClient::SamlToken::CONFIRM_HOLDER_OF_KEY;
  record.confirmationCertificate = client.certificate;
  record.groups = {"EXAMPLE\\Users",   "EXAMPLE\\Readers",    "EXAMPLE\\Operators", "EXAMPLE\\Auditors",
                   "EXAMPLE\\Backup",  "EXAMPLE\\Developers", "EXAMPLE\\Support",   "EXAMPLE\\Finance",
                   "EXAMPLE\\Printing", "EXAMPLE\\Remote Desktop Users"};
  record.givenName = "Alice";
  record.surname = "Example";
  record.isSolution = false;
  record.audience = {"https://service.example/one", "https://service.example/two"};
  record.renewCount = 5;
  record.proxyCount = 2;
  record.advice = {
      TokenIssuer::AdviceRecord{"urn:example:advice:portal",
                                {TokenIssuer::AttributeRecord{"urn:example:advice:tenant", {"north", "south"}}}},
      TokenIssuer::AdviceRecord{"urn:example:advice:gateway",
                                {TokenIssuer::AttributeRecord{"urn:example:advice:channel", {"web"}}}}};
  return record;
}

TokenRecord DelegatedRecord() {
  TokenRecord record;
  record.id = "_delegated-token";
  record.delegates = {TokenIssuer::DelegateRecord{"service-a@example.com", DateTime("2027-06-01T09:58:00Z")},
                      TokenIssuer::DelegateRecord{"service-b@example.com", DateTime("2027-06-01T09:59:00Z")}};
  record.delegateId = record.delegates.back();
  record.audience = {"https://service.example/one"};
  return record;
}

class VectorWriter {
 public:
  explicit VectorWriter(const std::string& directory) : _directory(directory) {}

  void Write(const std::string& name, const std::string& content) {
    std::ofstream out(_directory + "/" + name, std::ios::binary);
    out << content;
    if (!out) {
      std::cerr << "cannot write " << name << "\n";
      std::exit(1);
    }
  }

 private:
  std::string _directory;
};

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3) {
    std::cerr << "usage: generate_test_tokens KEYS_DIR OUTPUT_DIR\n";
    return 2;
  }
  const std::string keysDir = argv[1];
  VectorWriter out(argv[2]);
  Tamber::System::Testing::SetTestClock(DateTime(ISSUE_INSTANT).GetUtcTime());

  const Signer sts = LoadSigner(keysDir, "sts");
  const Signer stsEc = LoadSigner(keysDir, "sts-ec");
  const Signer client = LoadSigner(keysDir, "client");
  const Signer untrusted = LoadSigner(keysDir, "untrusted");
  const Signer expired = LoadSigner(keysDir, "expired-sts");
  auto issue = [](const TokenRecord& record, const Signer& signer) {
    return TokenIssuer::IssueToken(record, *signer.key, *signer.certificate);
  };

  // Accepted tokens.
  const std::string bearer = issue(BearerRecord(), sts);
  const std::string holderOfKey = issue(HolderOfKeyRecord(client), sts);
  out.Write("valid-bearer.xml", bearer);
  out.Write("valid-holder-of-key.xml", holderOfKey);
  out.Write("valid-delegated.xml", issue(DelegatedRecord(), sts));
  out.Write("valid-ec-signer.xml", issue(BearerRecord(), stsEc));
  out.Write("valid-with-xml-declaration.xml", "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n" + bearer);
  out.Write("valid-with-utf8-bom.xml", "\xEF\xBB\xBF" + bearer);
  TokenRecord indentedRecord = HolderOfKeyRecord(client);
  indentedRecord.indent = true;
  const std::string indented = issue(indentedRecord, sts);
  out.Write("valid-indented.xml", indented);
  // Comments are outside what exclusive canonicalisation without comments signs; the whitespace
  // around them is signed and stays as it was.
  std::string commented = ReplaceOnce(indented, "</saml2:Issuer>", "</saml2:Issuer><!-- signed below -->");
  commented = ReplaceOnce(commented, "\n  <saml2:Conditions", "<!-- conditions -->\n  <saml2:Conditions");
  out.Write("valid-with-comments.xml", commented);

  // Signed by keys that are not trusted, or not the key named in KeyInfo.
  out.Write("untrusted-signer.xml", issue(BearerRecord(), untrusted));
  out.Write("expired-signer.xml", issue(BearerRecord(), expired));
  out.Write("keyinfo-certificate-swapped.xml",
            ReplaceOnce(bearer, Base64Der(*sts.certificate), Base64Der(*client.certificate)));

  // Signed values changed after signing.
  out.Write("tampered-group.xml", ReplaceOnce(holderOfKey, ">EXAMPLE\\Readers<", ">EXAMPLE\\Administrators<"));
  out.Write("tampered-not-on-or-after.xml",
            ReplaceOnce(holderOfKey, "NotOnOrAfter=\"2027-06-01T11:00:00.000Z\"",
                        "NotOnOrAfter=\"2027-06-02T11:00:00.000Z\""));
  out.Write("tampered-subject.xml", ReplaceOnce(bearer, ">alice@example.com<", ">mallory@example.com<"));
  out.Write("signature-removed.xml", ReplaceOnce(bearer, Excerpt(bearer, "<ds:Signature", "</ds:Signature>"), ""));
  // A value prefix re-bound: the signature names xs among its inclusive namespaces.
  out.Write("prefix-rebound-in-attribute-value.xml",
            ReplaceOnce(holderOfKey, "xmlns:xs=\"http://www.w3.org/2001/XMLSchema\"", "xmlns:xs=\"urn:evil\""));

  // Text that canonicalises to the signed text but reads differently.
  TokenRecord splitRecord = BearerRecord();
  splitRecord.subject = "alice@example.com.evil.com";
  out.Write("comment-split-nameid.xml",
            ReplaceOnce(issue(splitRecord, sts), ">alice@example.com.evil.com<", ">alice@example.com<!---->.evil.com<"));
  out.Write("cdata-in-nameid.xml",
            ReplaceOnce(bearer, ">alice@example.com<", "><![CDATA[alice@example.com]]><"));

  // Signature wrapping: the signed assertion hidden where the reader does not look, under an
  // attacker's assertion with the same ID and the original's signature.
  const std::string renew = "<saml2:Condition xsi:type=\"rsa:RenewRestrictionType\" Count=\"5\"/>";
  const std::string evil = ReplaceOnce(holderOfKey, ">alice@example.com<", ">mallory@example.com<");
  out.Write("assertion-wrapped-in-renew-condition.xml",
            ReplaceOnce(evil, renew,
                        "<saml2:Condition xsi:type=\"rsa:RenewRestrictionType\" Count=\"5\">" + holderOfKey +
                            "</saml2:Condition>"));
  // The signed assertion untouched at the root with a second one added inside it.
  out.Write("second-assertion-in-renew-condition.xml",
            ReplaceOnce(holderOfKey, renew,
                        "<saml2:Condition xsi:type=\"rsa:RenewRestrictionType\" Count=\"5\">" + evil +
                            "</saml2:Condition>"));

  // References that leave the document.
  const std::string reference = Excerpt(bearer, "<ds:Reference ", "</ds:Reference>");
  out.Write("reference-uri-remote-http.xml",
            ReplaceOnce(bearer, reference,
                        reference + ReplaceOnce(reference, "URI=\"#_bearer-token\"",
                                                "URI=\"http://127.0.0.1:@PORT@/token\"")));
  out.Write("reference-uri-file.xml", ReplaceOnce(bearer, "URI=\"#_bearer-token\"", "URI=\"file:///etc/hostname\""));

  // Documents the hardened parser refuses.
  out.Write("doctype-internal-entity.xml",
            "<!DOCTYPE saml2:Assertion [<!ENTITY user \"alice@example.com\">]>\n" +
                ReplaceOnce(bearer, ">alice@example.com<", ">&user;<"));
  out.Write("doctype-external-entity.xml",
            "<!DOCTYPE saml2:Assertion [<!ENTITY user SYSTEM \"file:///etc/hostname\">]>\n" +
                ReplaceOnce(bearer, ">alice@example.com<", ">&user;<"));
  out.Write("dtd-attribute-default.xml",
            "<!DOCTYPE saml2:Assertion [<!ATTLIST saml2:Assertion SchemaLocation CDATA \"urn:x\">]>\n" + bearer);
  out.Write("nul-byte.xml", ReplaceOnce(bearer, ">alice@example.com<", std::string(">alice\0@example.com<", 20)));
  out.Write("invalid-utf8.xml", ReplaceOnce(bearer, ">alice@example.com<", ">alice\xC3\x28@example.com<"));

  // Templates for the tokens that generate.sh signs with xmlsec1: without their signature.
  out.Write("unsigned-bearer.xml.in",
            ReplaceOnce(bearer, Excerpt(bearer, "<ds:Signature", "</ds:Signature>"), "@SIGNATURE@"));
  out.Write("unsigned-holder-of-key.xml.in",
            ReplaceOnce(holderOfKey, Excerpt(holderOfKey, "<ds:Signature", "</ds:Signature>"), "@SIGNATURE@"));
  return 0;
}
