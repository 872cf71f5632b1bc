#include <array>
#include <memory>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>
#include <openssl/evp.h>
#include <openssl/pem.h>
#include <openssl/rsa.h>

#include <devsts/certificates.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/checked_cast.h>
#include <tarnik/core/reader.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/security/signature.h>
#include <tarnik/xml/xml_parser.h>

#include "sample_token.h"
#include "sts/request_builder.h"

// Makes whole requests signed with RSA-SHA256, and only the signatures of two references, and
// compares both with the lower bound: only the RSA operation.
namespace Bench {
namespace {

namespace Xml = Tarnik::Xml;

constexpr const char* kExclusive = "http://www.w3.org/2001/10/xml-exc-c14n#";
constexpr const char* kSha256 = "http://www.w3.org/2001/04/xmlenc#sha256";
constexpr const char* kRsaSha256 = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";

const DevSts::Credential& Signer() {
  static const DevSts::Credential signer = [] {
    DevSts::CertificateSpec spec;
    spec.commonName = "client";
    spec.keyType = DevSts::KeyType::Rsa2048;
    return DevSts::MakeCertificate(spec);
  }();
  return signer;
}

Tarnik::Ref<Xml::Document> ParseRequest(std::size_t bytes) {
  const std::string text =
      "<s:Envelope xmlns:s=\"urn:soap\"><s:Header><w:Security xmlns:w=\"urn:wsse\"><w:Timestamp "
      "Id=\"time\">now</w:Timestamp></w:Security></s:Header><s:Body Id=\"body\">" +
      std::string(bytes, 'x') + "</s:Body></s:Envelope>";
  const auto reader = Tarnik::CreateStringReader(text);
  const auto handler = Xml::CreateXMLDocumentHandler();
  const auto parsed = Xml::CreateXMLParser(reader.get(), handler.get())->Parse();
  return Tarnik::Ref<Xml::Document>(Tarnik::CheckedCast<Xml::Document>(parsed.get()));
}

// NOLINTBEGIN(performance-unnecessary-value-param): the benchmark library's form
void SignRequest(benchmark::State& state) {
  const auto key = Tarnik::Crypto::CreatePrivateKeyFromPem(Signer().privateKeyPem);
  const auto document = ParseRequest(static_cast<std::size_t>(state.range(0)));
  for (auto _ : state) {
    Tarnik::Ref<Xml::Security::Signature> signature;
    Xml::Security::CreateBlankSignature(document->RootElement(), kExclusive, kRsaSha256, "ds",
                                        signature);
    signature->AddReference("#body", kSha256)->AddTransform(kExclusive);
    signature->AddReference("#time", kSha256)->AddTransform(kExclusive);
    signature->Sign(key.get());
    benchmark::DoNotOptimize(signature->Element());
  }
}
BENCHMARK(SignRequest)->Arg(2000)->Arg(20000)->Unit(benchmark::kMicrosecond);

SsoClient::RequestBuilderImpl MakeBuilder() {
  return SsoClient::RequestBuilderImpl(SsoClient::HolderOfKeyConfig{
      Tarnik::Crypto::CreateCertificatesFromPem(Signer().certificatePem).front(),
      Tarnik::Crypto::CreatePrivateKeyFromPem(Signer().privateKeyPem)});
}

SsoClient::TokenSpec OneHour() {
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  return spec;
}

void CertificateRequest(benchmark::State& state) {
  const auto builder = MakeBuilder();
  const auto spec = OneHour();
  for (auto _ : state) {
    SsoClient::SoapRequest request;
    builder.BuildAcquireTokenByCertificateRequest(spec, request);
    benchmark::DoNotOptimize(request.body.data());
  }
}
BENCHMARK(CertificateRequest)->Unit(benchmark::kMicrosecond);

void TokenRequest(benchmark::State& state) {
  const auto builder = MakeBuilder();
  const auto spec = OneHour();
  const auto size = static_cast<std::size_t>(state.range(0));
  const auto token = SsoClient::CreateSamlToken(GetSampleToken(size).xml);
  for (auto _ : state) {
    SsoClient::SoapRequest request;
    builder.BuildAcquireTokenByTokenRequest(*token, spec, request);
    benchmark::DoNotOptimize(request.body.data());
  }
}
BENCHMARK(TokenRequest)->Arg(6000)->Unit(benchmark::kMicrosecond);

struct FreeKey {
  void operator()(EVP_PKEY* key) const { EVP_PKEY_free(key); }
};
struct FreeContext {
  void operator()(EVP_PKEY_CTX* context) const { EVP_PKEY_CTX_free(context); }
};

void FloorSign(benchmark::State& state) {
  const std::string& pem = Signer().privateKeyPem;
  BIO* source = BIO_new_mem_buf(pem.data(), static_cast<int>(pem.size()));
  const std::unique_ptr<EVP_PKEY, FreeKey> key(
      PEM_read_bio_PrivateKey(source, nullptr, nullptr, nullptr));
  BIO_free(source);
  const std::unique_ptr<EVP_PKEY_CTX, FreeContext> context(EVP_PKEY_CTX_new(key.get(), nullptr));
  const std::array<unsigned char, 32> digest{};
  std::vector<unsigned char> value(256);
  bool isGood = EVP_PKEY_sign_init(context.get()) == 1 &&
                EVP_PKEY_CTX_set_rsa_padding(context.get(), RSA_PKCS1_PADDING) == 1 &&
                EVP_PKEY_CTX_set_signature_md(context.get(), EVP_sha256()) == 1;
  for (auto _ : state) {
    std::size_t length = value.size();
    isGood = isGood &&
             EVP_PKEY_sign(context.get(), value.data(), &length, digest.data(), digest.size()) == 1;
  }
  if (!isGood) {
    state.SkipWithError("OpenSSL failed");
  }
}
BENCHMARK(FloorSign)->Unit(benchmark::kMicrosecond);
// NOLINTEND(performance-unnecessary-value-param)

}  // namespace
}  // namespace Bench

BENCHMARK_MAIN();
