// What a relying party pays per token: CreateSamlToken on a realistic holder-of-key token, against
// the floor of the same work done directly with libxml2 and xmlsec (parse, then verify with the
// signer's public key already decoded and trusted, no strict walk, no checks).

#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>

#include <benchmark/benchmark.h>
#include <libxml/parser.h>
#include <libxml/tree.h>
#include <openssl/evp.h>
#include <openssl/x509.h>
#include <xmlsec/openssl/evp.h>
#include <xmlsec/xmldsig.h>
#include <xmlsec/xmltree.h>

#include "TokenIssuer.h"
#include "ssoClient/SamlToken.h"

namespace {

std::string ReadKeyFile(const std::string& name) {
  std::ifstream in(std::string(SSOCLIENT_TEST_DATA_DIR) + "/keys/" + name, std::ios::binary);
  if (!in) throw std::runtime_error("cannot read " + name);
  std::ostringstream content;
  content << in.rdbuf();
  return content.str();
}

Tamber::Ref<const Tamber::Crypto::Certificate> Certificate(const std::string& name) {
  Tamber::Ref<const Tamber::Crypto::Certificate> certificate;
  Tamber::Crypto::CreateCertificateFromPem(ReadKeyFile(name + ".pem"), certificate);
  return certificate;
}

// A holder-of-key token as an STS issues it: ten groups, names, advice, audience, restrictions.
// Valid for a day from now, so that the real clock accepts it.
const std::string& RealisticToken() {
  static const std::string xml = [] {
    Tamber::Ref<const Tamber::Crypto::PrivateKey> key;
    Tamber::Crypto::CreatePrivateKeyFromPem(ReadKeyFile("sts.key"), key);
    TokenIssuer::TokenRecord record;
    record.confirmation = SsoClient::SamlToken::CONFIRM_HOLDER_OF_KEY;
    record.confirmationCertificate = Certificate("client");
    record.notOnOrAfter = Tamber::System::DateTimeFromUtc(record.notBefore.GetUtcTime() + 86400LL * 1000000, false);
    for (int i = 1; i <= 10; ++i) record.groups.push_back("EXAMPLE\\Group " + std::to_string(i));
    record.givenName = "Alice";
    record.surname = "Example";
    record.isSolution = false;
    record.audience = {"https://service.example/one", "https://service.example/two"};
    record.renewCount = 5;
    record.proxyCount = 2;
    record.advice = {TokenIssuer::AdviceRecord{
        "urn:example:advice:portal", {TokenIssuer::AttributeRecord{"urn:example:advice:tenant", {"north", "south"}}}}};
    return TokenIssuer::IssueToken(record, *key, *Certificate("sts"));
  }();
  return xml;
}

void ValidateToken(benchmark::State& state, const SsoClient::CertificateList& trusted) {
  const std::string& xml = RealisticToken();
  for (auto _ : state) {
    benchmark::DoNotOptimize(SsoClient::CreateSamlToken(xml, trusted));
  }
  state.SetItemsProcessed(state.iterations());
  state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(xml.size()));
  state.counters["token_bytes"] = static_cast<double>(xml.size());
}

void BM_CreateSamlToken_TrustSigner(benchmark::State& state) {
  static const SsoClient::CertificateList trusted{Certificate("sts")};
  ValidateToken(state, trusted);
}

void BM_CreateSamlToken_TrustCa(benchmark::State& state) {
  static const SsoClient::CertificateList trusted{Certificate("ca")};
  ValidateToken(state, trusted);
}

// The signer's public key as xmlsec wants it, decoded once.
xmlSecKeyPtr SignerKey() {
  static xmlSecKeyPtr key = [] {
    const std::vector<unsigned char>& der = Certificate("sts")->GetDer();
    const unsigned char* p = der.data();
    X509* x509 = d2i_X509(nullptr, &p, static_cast<long>(der.size()));
    EVP_PKEY* publicKey = X509_get_pubkey(x509);
    X509_free(x509);
    xmlSecKeyPtr prepared = xmlSecKeyCreate();
    xmlSecKeySetValue(prepared, xmlSecOpenSSLEvpKeyAdopt(publicKey));
    return prepared;
  }();
  return key;
}

bool FloorVerify(const std::string& xml) {
  xmlDocPtr doc = xmlReadMemory(xml.data(), static_cast<int>(xml.size()), nullptr, nullptr, XML_PARSE_NONET);
  xmlNodePtr root = xmlDocGetRootElement(doc);
  xmlAttrPtr id = xmlHasProp(root, BAD_CAST "ID");
  xmlChar* value = xmlNodeListGetString(doc, id->children, 1);
  xmlAddID(nullptr, doc, value, id);
  xmlFree(value);
  xmlNodePtr signature = xmlSecFindNode(root, xmlSecNodeSignature, xmlSecDSigNs);
  xmlSecDSigCtxPtr context = xmlSecDSigCtxCreate(nullptr);
  context->signKey = xmlSecKeyDuplicate(SignerKey());
  const bool valid = xmlSecDSigCtxVerify(context, signature) == 0 && context->status == xmlSecDSigStatusSucceeded;
  xmlSecDSigCtxDestroy(context);
  xmlFreeDoc(doc);
  return valid;
}

void BM_Floor_LibXml2AndXmlsec(benchmark::State& state) {
  const std::string& xml = RealisticToken();
  if (!FloorVerify(xml)) {
    state.SkipWithError("the floor does not verify the token");
    return;
  }
  for (auto _ : state) benchmark::DoNotOptimize(FloorVerify(xml));
  state.SetItemsProcessed(state.iterations());
  state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(xml.size()));
}

}  // namespace

BENCHMARK(BM_CreateSamlToken_TrustSigner)->Threads(1)->Threads(2)->UseRealTime();
BENCHMARK(BM_CreateSamlToken_TrustCa)->Threads(1)->Threads(2)->UseRealTime();
BENCHMARK(BM_Floor_LibXml2AndXmlsec)->Threads(1)->Threads(2)->UseRealTime();

int main(int argc, char** argv) {
  // The token is issued, and libxml2 and xmlsec are initialised through the library, before any
  // benchmark thread starts.
  SsoClient::CreateSamlToken(RealisticToken(), SsoClient::CertificateList{Certificate("sts")});
  SignerKey();
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
