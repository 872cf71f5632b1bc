// Signers who look like a trusted one, signers who are revoked, and lists of others.
#include <filesystem>

#include <ssoclient/access/trust_store.h>
#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/text/string_util.h>

#include "gate_attacks/attack_fixture.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"

namespace SsoClient::Access::Testing {
namespace {

using std::chrono::hours;
using Tarnik::Testing::Identity;
using Tarnik::Testing::MakeCrl;

const Identity& Authority() {
  static const Identity made = Tarnik::Testing::MakeCa("Authority");
  return made;
}

const Identity& Signer() {
  static const Identity made = Tarnik::Testing::MakeIdentity({.commonName = "STS"}, &Authority());
  return made;
}

DevSts::Credential CredentialOf(const Identity& identity) {
  return {identity.Pem(), identity.KeyPem()};
}

/// A gate that trusts `Signer`, of whom the lists in a folder say whether it is revoked.
class SignerAttacksTest : public AttackFixture {
 protected:
  SignerAttacksTest() {
    std::filesystem::create_directory(root.Path() + "/lists");
    PutList("a.crl", MakeCrl(Authority(), nullptr));
    store.issuers.resize(1);
    store.issuers[0].issuer = kTokenIssuer;
    store.issuers[0].certificatePaths = {root.Write("sts.pem", Signer().Pem())};
    store.issuers[0].revocationListPaths = {root.Path() + "/lists"};
    store.issuers[0].listSignerPaths = {root.Write("authority.pem", Authority().Pem())};
    store.isWatching = false;
  }

  void PutList(const std::string& name, const std::string& list) const {
    std::filesystem::rename(root.Write("new", list), root.Path() + "/lists/" + name);
  }
  std::shared_ptr<TokenGate> MakeGate() {
    config.trust = CreateTrustStore(store);
    return Make();
  }
  std::string SignedBy(const Identity& signer, const std::string& hint = {}) const {
    DevSts::SignOptions options;
    if (hint.empty()) {
      return text.ToSignedXml(CredentialOf(signer), options);
    }
    options.keyInfo = DevSts::KeyInfoContent::None;
    return InsertedAfter(text.ToSignedXml(CredentialOf(signer), options), "</ds:SignatureValue>",
                         "<ds:KeyInfo><ds:X509Data>" + hint + "</ds:X509Data></ds:KeyInfo>");
  }

  const Tarnik::Testing::TemporaryFolder root;
  const std::string token = SignedBy(Signer());
  TrustStoreConfig store;
};

TEST_F(SignerAttacksTest, AStrangerWithAllNamesOfTheSignerIsRefused) {
  const Identity lookalike = Tarnik::Testing::MakeLookalike(Signer());
  const auto certificate = Signer().ToCertificate();
  const auto strangers = lookalike.ToCertificate();
  ASSERT_EQ(strangers->SubjectName(), certificate->SubjectName());
  ASSERT_EQ(strangers->IssuerName(), certificate->IssuerName());
  ASSERT_EQ(strangers->SerialNumber(), certificate->SerialNumber());
  ASSERT_EQ(strangers->SubjectKeyIdentifier(), certificate->SubjectKeyIdentifier());
  const auto gate = MakeGate();
  ExpectAccepted(gate->Check(token, Presenter::Nobody()));
  ExpectRefused(gate->Check(SignedBy(lookalike), Presenter::Nobody()), Reason::kUnknownSigner,
                CheckKind::kSignerKnown);
  for (const std::string& hint :
       {"<ds:X509IssuerSerial><ds:X509IssuerName>" + certificate->IssuerName() +
            "</ds:X509IssuerName><ds:X509SerialNumber>" + certificate->SerialNumber() +
            "</ds:X509SerialNumber></ds:X509IssuerSerial>",
        "<ds:X509SubjectName>" + certificate->SubjectName() + "</ds:X509SubjectName>",
        "<ds:X509SKI>" + Tarnik::StringUtil::Base64Encode(certificate->SubjectKeyIdentifier()) +
            "</ds:X509SKI>"}) {
    ExpectAccepted(gate->Check(SignedBy(Signer(), hint), Presenter::Nobody()));
    ExpectRefused(gate->Check(SignedBy(lookalike, hint), Presenter::Nobody()),
                  Reason::kBadSignature, CheckKind::kSignature);
  }
}

TEST_F(SignerAttacksTest, ACertificateThatTheSignerIssuedIsRefused) {
  const Identity issued = Tarnik::Testing::MakeIdentity({.commonName = "STS"}, &Authority());
  const Identity child = Tarnik::Testing::MakeIdentity({.commonName = "STS"}, &Signer());
  const auto gate = MakeGate();
  for (const Identity* other : {&issued, &child, &Authority()}) {
    ExpectRefused(gate->Check(SignedBy(*other), Presenter::Nobody()), Reason::kUnknownSigner,
                  CheckKind::kSignerKnown);
  }
}

TEST_F(SignerAttacksTest, ASignerThatIsRevokedLaterIsRefusedAlsoForRememberedTokens) {
  const auto gate = MakeGate();
  ExpectAccepted(gate->Check(token, Presenter::Nobody()));
  ExpectAccepted(gate->Check(token, Presenter::Nobody()));
  ASSERT_EQ(gate->Metrics().cacheHits, 1U);
  PutList("a.crl", MakeCrl(Authority(), &Signer()));
  config.trust->Reload();
  ExpectRefused(gate->Check(token, Presenter::Nobody()), Reason::kSignerRevoked,
                CheckKind::kSignerRevoked);
  PutList("a.crl", MakeCrl(Authority(), nullptr));
  config.trust->Reload();
  ExpectAccepted(gate->Check(token, Presenter::Nobody()));
}

TEST_F(SignerAttacksTest, AListOfAnotherIssuerDoesNotRevokeTheSameNumber) {
  const Identity other = Tarnik::Testing::MakeCa("Other Authority");
  store.issuers[0].listSignerPaths.push_back(root.Write("other.pem", other.Pem()));
  PutList("b.crl", MakeCrl(other, &Signer()));
  const auto gate = MakeGate();
  ExpectAccepted(gate->Check(token, Presenter::Nobody()));
  PutList("b.crl", MakeCrl(Authority(), &Signer(), 3600, -1800));
  config.trust->Reload();
  ExpectRefused(gate->Check(token, Presenter::Nobody()), Reason::kSignerRevoked,
                CheckKind::kSignerRevoked);
}

// Nor does it show that the signer is not revoked.
TEST_F(SignerAttacksTest, AListOfAnotherIssuerDoesNotCoverTheSigner) {
  const Identity other = Tarnik::Testing::MakeCa("Other Authority");
  store.issuers[0].listSignerPaths.push_back(root.Write("other.pem", other.Pem()));
  PutList("a.crl", MakeCrl(other, nullptr));
  ExpectRefused(MakeGate()->Check(token, Presenter::Nobody()), Reason::kRevocationUnknown,
                CheckKind::kSignerRevoked);
  PutList("b.crl", MakeCrl(Authority(), nullptr));
  ExpectAccepted(MakeGate()->Check(token, Presenter::Nobody()));
}

TEST_F(SignerAttacksTest, AListByAStrangersKeyOfTheRightNameChangesNothing) {
  const Identity strange = Tarnik::Testing::MakeCa("Authority");
  const auto gate = MakeGate();
  ExpectAccepted(gate->Check(token, Presenter::Nobody()));
  for (const Identity* revoked : {&Signer(), static_cast<const Identity*>(nullptr)}) {
    PutList("b.crl", MakeCrl(strange, revoked));
    EXPECT_THROW(config.trust->Reload(), Tarnik::Crypto::CryptoException);
    ExpectAccepted(gate->Check(token, Presenter::Nobody()));
  }
  PutList("b.crl", MakeCrl(Authority(), &Signer(), 3600, -1800));
  config.trust->Reload();
  ExpectRefused(gate->Check(token, Presenter::Nobody()), Reason::kSignerRevoked,
                CheckKind::kSignerRevoked);
  // And it does not take the revocation back.
  PutList("b.crl", MakeCrl(strange, nullptr));
  EXPECT_THROW(config.trust->Reload(), Tarnik::Crypto::CryptoException);
  ExpectRefused(gate->Check(token, Presenter::Nobody()), Reason::kSignerRevoked,
                CheckKind::kSignerRevoked);
}

// An older list that somebody has kept from before a revocation.
TEST_F(SignerAttacksTest, AnOlderListDoesNotTakeARevocationBack) {
  PutList("a.crl", MakeCrl(Authority(), &Signer(), 3600, -1800));
  const auto gate = MakeGate();
  PutList("b.crl", MakeCrl(Authority(), nullptr, 7200, -3600));
  config.trust->Reload();
  ExpectRefused(gate->Check(token, Presenter::Nobody()), Reason::kSignerRevoked,
                CheckKind::kSignerRevoked);
  PutList("b.crl", MakeCrl(Authority(), nullptr, 7200, -900));
  config.trust->Reload();
  ExpectAccepted(gate->Check(token, Presenter::Nobody()));
}

TEST_F(SignerAttacksTest, AClockThatIsMovedBackRefusesRememberedTokensToo) {
  const auto gate = MakeGate();
  ExpectAccepted(gate->Check(token, Presenter::Nobody()));
  now = After(start, -hours(1));
  ExpectRefused(gate->Check(token, Presenter::Nobody()), Reason::kNotYetValid,
                CheckKind::kValidity);
  now = start;
  ExpectAccepted(gate->Check(token, Presenter::Nobody()));
  EXPECT_EQ(gate->Metrics().cacheMisses, 1U);
  now = After(start, hours(2));
  ExpectRefused(gate->Check(token, Presenter::Nobody()), Reason::kExpired, CheckKind::kValidity);
  now = start;
  ExpectAccepted(gate->Check(token, Presenter::Nobody()));
}

}  // namespace
}  // namespace SsoClient::Access::Testing
