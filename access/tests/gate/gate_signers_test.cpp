// Several signers that a signature may have been made by, with the selection of a real trust store.
#include <ssoclient/access/trust_store.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "gate/gate_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

class GateSignersTest : public GateFixture {
 protected:
  static DevSts::Credential NewCredential(bool freshKey = true) {
    DevSts::CertificateSpec spec;
    spec.commonName = "STS";  // one subject for all
    spec.freshKey = freshKey;
    return DevSts::MakeCertificate(spec);
  }
  static std::string SignedWithoutKeyInfo(const AssertionText& token,
                                          const DevSts::Credential& credential) {
    DevSts::SignOptions options;
    options.keyInfo = DevSts::KeyInfoContent::None;
    return token.ToSignedXml(credential, options);
  }
  void UseStore(const std::vector<DevSts::Credential>& credentials) {
    TrustStoreConfig storeConfig;
    storeConfig.isWatching = false;
    TrustedIssuer issuer;
    issuer.issuer = kTokenIssuer;
    for (const DevSts::Credential& credential : credentials) {
      issuer.certificates.push_back(CertificateOf(credential));
    }
    storeConfig.issuers.push_back(issuer);
    config.trust = CreateTrustStore(storeConfig);
  }
};

TEST_F(GateSignersTest, AnyOfSeveralSigners) {
  const auto first = NewCredential();
  const auto second = NewCredential();
  UseStore({first, second});
  for (const auto& credential : {first, second}) {
    ExpectAccepted(Check(text.ToSignedXml(credential)));
    ExpectAccepted(Check(SignedWithoutKeyInfo(text, credential)));
  }
  ExpectRefused(Check(SignedWithoutKeyInfo(text, NewCredential())), Reason::kBadSignature,
                CheckKind::kSignature);
}

// Its subject and issuer names are those of the trusted one.
TEST_F(GateSignersTest, StrangerWithTheTrustedNames) {
  const auto trusted = NewCredential();
  UseStore({trusted});
  ExpectRefused(Check(text.ToSignedXml(NewCredential())), Reason::kUnknownSigner,
                CheckKind::kSignerKnown);
  ExpectAccepted(Check(text.ToSignedXml(trusted)));
}

TEST_F(GateSignersTest, SixteenAreTried) {
  std::vector<DevSts::Credential> credentials;
  for (int i = 0; i < 17; ++i) {
    credentials.push_back(NewCredential());
  }
  UseStore(credentials);
  ExpectAccepted(Check(SignedWithoutKeyInfo(text, credentials[0])));
  ExpectAccepted(Check(SignedWithoutKeyInfo(text, credentials[15])));
  ExpectRefused(Check(SignedWithoutKeyInfo(text, credentials[16])), Reason::kBadSignature,
                CheckKind::kSignature);
  ExpectAccepted(Check(text.ToSignedXml(credentials[16])));
}

TEST_F(GateSignersTest, OnlyUsableSignersAreTried) {
  const auto first = NewCredential();
  const auto second = NewCredential();
  Signer expired = SignerOf(first);
  expired.notAfter = After(start, std::chrono::hours(-1));
  Signer revoked = SignerOf(first);
  revoked.isRevocationChecked = true;
  revoked.revokedSince = start;
  for (const Signer& unusable : {expired, revoked}) {
    trust->Set({{kTokenIssuer, {unusable, SignerOf(second)}}});
    ExpectAccepted(Check(SignedWithoutKeyInfo(text, second)));
    ExpectRefused(Check(SignedWithoutKeyInfo(text, first)), Reason::kBadSignature,
                  CheckKind::kSignature);
  }
  // They do not count among the sixteen.
  std::vector<Signer> many(16, expired);
  many.push_back(SignerOf(second));
  trust->Set({{kTokenIssuer, many}});
  ExpectAccepted(Check(SignedWithoutKeyInfo(text, second)));
  // The reason is that of the first one.
  Signer early = SignerOf(second);
  early.notBefore = After(start, std::chrono::hours(1));
  trust->Set({{kTokenIssuer, {expired, early}}});
  ExpectRefused(Check(SignedWithoutKeyInfo(text, second)), Reason::kSignerExpired,
                CheckKind::kSignerValid);
  Signer uncovered = SignerOf(second);
  uncovered.isRevocationChecked = true;
  trust->Set({{kTokenIssuer, {expired, uncovered}}});
  ExpectRefused(Check(SignedWithoutKeyInfo(text, first)), Reason::kRevocationUnknown,
                CheckKind::kSignerRevoked);
}

// What the gate accepts, the core accepts with the same trust.
TEST_F(GateSignersTest, CoreAgrees) {
  const auto first = NewCredential();
  const auto second = NewCredential();
  const auto stranger = NewCredential();
  UseStore({first, second});
  const auto resolver = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      {CertificateOf(first), CertificateOf(second)});
  int accepted = 0;
  for (const auto& credential : {first, second, stranger}) {
    for (const std::string& xml :
         {text.ToSignedXml(credential), SignedWithoutKeyInfo(text, credential)}) {
      if (Check(xml).IsAccepted()) {
        ++accepted;
        EXPECT_NO_THROW(CreateSamlToken(xml, resolver.get(), 300));
      }
    }
  }
  EXPECT_EQ(accepted, 4);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
