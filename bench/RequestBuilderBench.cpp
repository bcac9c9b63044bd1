// Cost of building requests. A certificate-signed issue request is measured against the floor of
// one RSA-2048 signature made by OpenSSL alone with the same key over a few hundred bytes: the
// request needs exactly one such signature, so the ratio shows what building, canonicalising,
// digesting and serialising add on top.
//
//   cmake -S . -B build-bench -DCMAKE_BUILD_TYPE=Release -DSSOCLIENT_BUILD_BENCH=ON
//   cmake --build build-bench --target RequestBuilderBench && build-bench/bench/RequestBuilderBench

#include <fstream>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>
#include <openssl/evp.h>
#include <openssl/pem.h>

#include "ssoClient/RequestBuilderImpl.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"

namespace {

std::string ReadKeyFile(const std::string& name) {
  std::ifstream in(std::string(SSOCLIENT_TEST_DATA_DIR) + "/keys/" + name, std::ios::binary);
  if (!in) throw std::runtime_error("cannot read key file " + name);
  std::ostringstream content;
  content << in.rdbuf();
  return content.str();
}

SsoClient::HolderOfKeyConfig ClientKeyMaterial() {
  SsoClient::HolderOfKeyConfig config;
  Tamber::Crypto::CreatePrivateKeyFromPem(ReadKeyFile("client.key"), config.privateKey);
  Tamber::Crypto::CreateCertificateFromPem(ReadKeyFile("client.pem"), config.certificate);
  return config;
}

SsoClient::TokenSpec Spec() {
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  return spec;
}

void CertificateSignedIssueRequest(benchmark::State& state) {
  const SsoClient::RequestBuilderImpl builder(ClientKeyMaterial());
  const SsoClient::TokenSpec spec = Spec();
  for (auto _ : state) {
    SsoClient::Request request;
    builder.BuildCertificateTokenRequest(spec, request);
    benchmark::DoNotOptimize(request.body.data());
  }
}
BENCHMARK(CertificateSignedIssueRequest)->Unit(benchmark::kMicrosecond);

// The floor: one RSA-SHA256 signature over as many bytes as a request's SignedInfo, with the
// same key, through OpenSSL alone (context set up per signature, as a signer must).
void OpenSslSignatureFloor(benchmark::State& state) {
  const std::string pem = ReadKeyFile("client.key");
  std::unique_ptr<BIO, decltype(&BIO_free)> bio(BIO_new_mem_buf(pem.data(), static_cast<int>(pem.size())), BIO_free);
  std::unique_ptr<EVP_PKEY, decltype(&EVP_PKEY_free)> key(PEM_read_bio_PrivateKey(bio.get(), nullptr, nullptr, nullptr),
                                                          EVP_PKEY_free);
  if (!key) throw std::runtime_error("cannot read client.key");
  const std::string signedInfo(600, 'x');
  std::vector<unsigned char> signature(EVP_PKEY_get_size(key.get()));
  for (auto _ : state) {
    std::unique_ptr<EVP_MD_CTX, decltype(&EVP_MD_CTX_free)> context(EVP_MD_CTX_new(), EVP_MD_CTX_free);
    size_t length = signature.size();
    if (EVP_DigestSignInit(context.get(), nullptr, EVP_sha256(), nullptr, key.get()) != 1 ||
        EVP_DigestSign(context.get(), signature.data(), &length,
                       reinterpret_cast<const unsigned char*>(signedInfo.data()), signedInfo.size()) != 1) {
      state.SkipWithError("EVP_DigestSign failed");
      break;
    }
    benchmark::DoNotOptimize(signature.data());
  }
}
BENCHMARK(OpenSslSignatureFloor)->Unit(benchmark::kMicrosecond);

void UnsignedUserNameRequest(benchmark::State& state) {
  const SsoClient::RequestBuilderImpl builder(boost::none);
  const SsoClient::TokenSpec spec = Spec();
  for (auto _ : state) {
    SsoClient::Request request;
    builder.BuildUserPassTokenRequest("alice@example.com", "s3cret", spec, request);
    benchmark::DoNotOptimize(request.body.data());
  }
}
BENCHMARK(UnsignedUserNameRequest)->Unit(benchmark::kMicrosecond);

}  // namespace

BENCHMARK_MAIN();
