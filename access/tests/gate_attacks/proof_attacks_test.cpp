// Presenters without the key of a holder-of-key token, and tokens of confused kinds.
#include <tarnik/crypto/data_signature.h>

#include "gate_attacks/attack_fixture.h"
#include "gate_attacks/counted_comparisons.h"
#include "support/test_pki.h"

namespace SsoClient::Access::Testing {
namespace {

using Tarnik::Crypto::SignatureAlgorithm;
using Tarnik::Testing::Identity;

const std::string kChallenge = "a challenge of the service";

class ProofAttacksTest : public AttackFixture {
 protected:
  void ExpectWrong(const Presenter& presenter) const {
    ExpectRefused(Check(token, presenter), Reason::kWrongProof, CheckKind::kPossession);
  }
  static std::vector<unsigned char> ProofOf(const std::string& data) {
    return Signing(data, data, HolderCredential()).Signature();
  }
  static Presenter Sending(const std::vector<unsigned char>& proof,
                           SignatureAlgorithm algorithm = SignatureAlgorithm::kEcdsaSha256) {
    return Presenter::WithSignature(kChallenge, proof, algorithm);
  }

  const std::string token = Signed(HolderOfKeyText());
};

TEST_F(ProofAttacksTest, AProofByTheKeyOfAnotherTokenIsRefused) {
  const std::string other =
      Signed(AssertionText(text).ConfirmByKey(OtherHolderCredential().certificatePem));
  const Presenter proof = Signing(kChallenge, kChallenge, OtherHolderCredential());
  ExpectAccepted(Check(other, proof));
  ExpectWrong(proof);
  ExpectWrong(Signing(kChallenge, kChallenge, TrustedCredential()));
  ExpectAccepted(Check(token, Signing(kChallenge, kChallenge, HolderCredential())));
}

TEST_F(ProofAttacksTest, AProofOfOtherDataIsRefused) {
  ExpectAccepted(Check(token, Sending(ProofOf(kChallenge))));
  for (const std::string& data : {kChallenge + " ", std::string(), kChallenge + '\0',
                                  kChallenge.substr(1), Signed(HolderOfKeyText())}) {
    ExpectWrong(Sending(ProofOf(data)));
  }
  ExpectWrong(Presenter::WithSignature("", ProofOf(kChallenge), SignatureAlgorithm::kEcdsaSha256));
}

TEST_F(ProofAttacksTest, AProofWithAnotherAlgorithmIsRefused) {
  ExpectAccepted(Check(token, Signing(kChallenge, kChallenge, HolderCredential(),
                                      SignatureAlgorithm::kEcdsaSha384)));
  const std::vector<unsigned char> proof = ProofOf(kChallenge);
  ExpectAccepted(Check(token, Sending(proof)));
  for (const SignatureAlgorithm other :
       {SignatureAlgorithm::kEcdsaSha384, SignatureAlgorithm::kEcdsaSha512,
        SignatureAlgorithm::kRsaPkcs1Sha256, SignatureAlgorithm::kRsaPssSha256,
        static_cast<SignatureAlgorithm>(99), static_cast<SignatureAlgorithm>(-1)}) {
    ExpectWrong(Sending(proof, other));
  }
}

TEST_F(ProofAttacksTest, AProofThatIsNoSignatureIsRefused) {
  const std::vector<unsigned char> proof = ProofOf(kChallenge);
  std::vector<unsigned char> longer = proof;
  longer.push_back(0);
  std::vector<unsigned char> changed = proof;
  changed.back() ^= 1;
  ExpectAccepted(Check(token, Sending(proof)));
  for (const std::vector<unsigned char>& other :
       {std::vector<unsigned char>(), std::vector<unsigned char>(proof.size()),
        std::vector<unsigned char>(proof.begin(), proof.end() - 1), longer, changed,
        std::vector<unsigned char>(1'000'000, 0xFF)}) {
    ExpectWrong(Sending(other));
  }
}

TEST_F(ProofAttacksTest, NoProofOfAnyKindIsRefused) {
  ExpectAccepted(Check(token, WithTls(HolderCredential())));
  ExpectRefused(Check(token), Reason::kNoProof, CheckKind::kPossession);
  ExpectRefused(Check(token, Presenter::WithTlsCertificate(nullptr)), Reason::kNoProof,
                CheckKind::kPossession);
}

// A remembered token, too.
TEST_F(ProofAttacksTest, AnotherTlsCertificateIsRefused) {
  const Identity authority = Tarnik::Testing::MakeCa("Authority");
  const Identity holder = Tarnik::Testing::MakeIdentity({.commonName = "holder"}, &authority);
  const Identity sameNames = Tarnik::Testing::MakeLookalike(holder);
  const Identity sameKey = Tarnik::Testing::MakeRenewed(holder, authority);
  const std::string bound = Signed(AssertionText(text).ConfirmByKey(holder.Pem()));
  const auto gate = Make();
  ExpectAccepted(gate->Check(bound, Presenter::WithTlsCertificate(holder.ToCertificate())));
  for (const Identity* other : {&sameNames, &sameKey, &authority}) {
    ExpectRefused(gate->Check(bound, Presenter::WithTlsCertificate(other->ToCertificate())),
                  Reason::kWrongProof, CheckKind::kPossession);
  }
  ExpectAccepted(gate->Check(bound, Presenter::WithTlsCertificate(holder.ToCertificate())));
}

TEST_F(ProofAttacksTest, ABearerTokenIsNotStrongerForAProof) {
  const std::string bearer = Signed(text);
  const Verdict verdict = Check(bearer, WithTls(OtherHolderCredential()));
  ExpectAccepted(verdict);
  EXPECT_NE(RecordOf(verdict, CheckKind::kConfirmation).compared.find("was not compared"),
            std::string::npos);
  config.bearerTokens = BearerTokens::kRefuse;
  ExpectRefused(Check(bearer, WithTls(OtherHolderCredential())), Reason::kBearerRefused,
                CheckKind::kConfirmation);
  ExpectAccepted(Check(token, WithTls(HolderCredential())));
}

TEST_F(ProofAttacksTest, ATokenWithTwoConfirmationsIsRefused) {
  const auto confirmationOf = [](const AssertionText& assertion) {
    const std::size_t begin = assertion.subject.find("<saml2:SubjectConfirmation ");
    const std::size_t end = assertion.subject.find("</saml2:Subject>");
    return assertion.subject.substr(begin, end - begin);
  };
  const std::string bearer = confirmationOf(text);
  const std::string holder = confirmationOf(HolderOfKeyText());
  const auto with = [&](const std::string& confirmations) {
    AssertionText changed = text;
    changed.subject = Replaced(changed.subject, bearer, confirmations);
    return Check(Signed(changed), WithTls(HolderCredential()));
  };
  ExpectAccepted(with(bearer));
  ExpectAccepted(with(holder));
  for (const std::string& two :
       {bearer + holder, holder + bearer, bearer + bearer, holder + holder, std::string()}) {
    ExpectRefused(with(two), Reason::kBadLayout, CheckKind::kLayout);
  }
}

// Nor by the method of one kind with the data of the other.
TEST_F(ProofAttacksTest, ATokenOfMixedKindsIsRefused) {
  AssertionText bearerWithKey = HolderOfKeyText();
  ExpectAccepted(Check(Signed(bearerWithKey), WithTls(HolderCredential())));
  bearerWithKey.subject = Replaced(bearerWithKey.subject, "cm:holder-of-key", "cm:bearer");
  ExpectRefused(Check(Signed(bearerWithKey)), Reason::kBadLayout, CheckKind::kLayout);
  AssertionText holderWithoutKey = text;
  ExpectAccepted(Check(Signed(holderWithoutKey)));
  holderWithoutKey.subject = Replaced(holderWithoutKey.subject, "cm:bearer", "cm:holder-of-key");
  ExpectRefused(Check(Signed(holderWithoutKey), WithTls(HolderCredential())), Reason::kBadLayout,
                CheckKind::kLayout);
  AssertionText vouched = text;
  vouched.subject = Replaced(vouched.subject, "cm:bearer", "cm:sender-vouches");
  ExpectRefused(Check(Signed(vouched)), Reason::kBadLayout, CheckKind::kLayout);
}

// Wherever two certificates of one length differ, one comparison reads all their bytes.
TEST_F(ProofAttacksTest, CertificatesAreComparedInConstantTime) {
  const auto holder = CertificateOf(HolderCredential());
  const auto gate = Make();
  ExpectAccepted(gate->Check(token, Presenter::WithTlsCertificate(holder)));
  for (const std::size_t place : {holder->DerLength(), std::size_t{60}, holder->DerLength() - 1}) {
    std::vector<unsigned char> bytes(holder->DerBytes(), holder->DerBytes() + holder->DerLength());
    const bool isSame = place == bytes.size();
    if (!isSame) {
      bytes[place] ^= 1;
    }
    const auto other = Tarnik::Crypto::CreateCertificateFromDer(bytes.data(), bytes.size());
    const CountedComparisons comparisons;
    EXPECT_EQ(gate->Check(token, Presenter::WithTlsCertificate(other)).IsAccepted(), isSame);
    EXPECT_EQ(comparisons.Lengths(), std::vector<std::size_t>{bytes.size()});
  }
}

}  // namespace
}  // namespace SsoClient::Access::Testing
