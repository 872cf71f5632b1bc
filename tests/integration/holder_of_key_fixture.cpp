#include "integration/holder_of_key_fixture.h"

#include <chrono>
#include <cstring>
#include <ctime>
#include <memory>
#include <string>
#include <vector>

#include "support/holder_of_key.h"

namespace SsoClient::Testing {

namespace {

DevSts::CertificateSpec RsaSpec(const std::string& commonName) {
  DevSts::CertificateSpec spec;
  spec.commonName = commonName;
  spec.keyType = DevSts::KeyType::Rsa2048;
  return spec;
}

std::string TimeText(std::chrono::seconds fromNow) {
  const auto seconds = std::chrono::floor<std::chrono::seconds>(
      (std::chrono::system_clock::now() + fromNow).time_since_epoch());
  const std::time_t time = seconds.count();
  std::tm utc{};
  gmtime_r(&time, &utc);
  char text[32];
  std::strftime(text, sizeof text, "%Y-%m-%dT%H:%M:%SZ", &utc);
  return text;
}

}  // namespace

const DevSts::Credential& Holder() {
  static const DevSts::Credential holder = DevSts::MakeCertificate(RsaSpec("holder"));
  return holder;
}

const DevSts::Credential& Stranger() {
  static const DevSts::Credential stranger = DevSts::MakeCertificate(RsaSpec("stranger"));
  return stranger;
}

DevSts::Credential HolderValidBetween(std::chrono::seconds notBefore,
                                      std::chrono::seconds notAfter) {
  DevSts::CertificateSpec spec = RsaSpec("holder");
  spec.notBefore = notBefore;
  spec.notAfter = notAfter;
  return DevSts::MakeCertificate(spec);
}

std::shared_ptr<SecurityTokenService> MakeHolderService(const DevSts::Server& server,
                                                        const std::string& url,
                                                        const DevSts::Credential& credential) {
  return MakeService(server, url, ConfigOf(credential));
}

TokenSpec RenewableAndDelegable() {
  TokenSpec spec = TenMinutes();
  spec.renewable = true;
  spec.delegable = true;
  return spec;
}

TokenSpec Bearer() {
  TokenSpec spec = TenMinutes();
  spec.confirmation = CONFIRMATION_BEARER;
  return spec;
}

std::vector<std::string> ChainOf(const SamlToken& token) {
  std::vector<Delegate> chain;
  token.GetDelegationChain(chain);
  std::vector<std::string> names;
  for (const Delegate& link : chain) {
    names.push_back(link.delegate.name);
  }
  return names;
}

bool IsBoundTo(const SamlToken& token, const DevSts::Credential& credential) {
  const auto bound = token.HolderOfKeyCertificate();
  const auto certificate =
      Tarnik::Crypto::CreateCertificatesFromPem(credential.certificatePem).front();
  return token.ConfirmationType() == HOLDER_OF_KEY && bound != nullptr &&
         bound->DerLength() == certificate->DerLength() &&
         std::memcmp(bound->DerBytes(), certificate->DerBytes(), bound->DerLength()) == 0;
}

DevSts::AssertionOptions ValidBetween(std::chrono::seconds start, std::chrono::seconds end) {
  DevSts::AssertionOptions options;
  options.beforeSigning = [start, end](std::string& text) {
    const auto from = text.find("<saml2:Conditions ");
    text.replace(from, text.find('>', from) - from,
                 "<saml2:Conditions NotBefore=\"" + TimeText(start) + "\" NotOnOrAfter=\"" +
                     TimeText(end) + "\"");
  };
  return options;
}

}  // namespace SsoClient::Testing
