#include "gate_attacks/attack_fixture.h"

#include <utility>

#include <ssoclient/access/trust_store.h>
#include <tarnik/crypto/data_signature.h>

namespace SsoClient::Access::Testing {

AttackFixture::AttackFixture() {
  Trust({CertificateOf(TrustedCredential())});
  config.audiences = {kAudience};
  config.bearerTokens = BearerTokens::kAccept;
  config.clock = [this] { return now; };
}

void AttackFixture::Trust(
    std::vector<Tarnik::Ref<const Tarnik::Crypto::Certificate>> certificates) {
  TrustStoreConfig store;
  store.issuers.resize(1);
  store.issuers[0].issuer = kTokenIssuer;
  store.issuers[0].certificates = std::move(certificates);
  store.isWatching = false;
  config.trust = CreateTrustStore(std::move(store));
}

Presenter Signing(const std::string& data, const std::string& signedData,
                  const DevSts::Credential& credential,
                  Tarnik::Crypto::SignatureAlgorithm algorithm) {
  const auto key = Tarnik::Crypto::CreatePrivateKeyFromPem(credential.privateKeyPem);
  return Presenter::WithSignature(data, Tarnik::Crypto::SignData(*key, algorithm, signedData),
                                  algorithm);
}

Presenter WithTls(const DevSts::Credential& credential) {
  return Presenter::WithTlsCertificate(CertificateOf(credential));
}

}  // namespace SsoClient::Access::Testing
