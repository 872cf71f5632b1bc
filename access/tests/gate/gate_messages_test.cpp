// Messages of refusals, which say each thing once.
#include <chrono>
#include <stdexcept>
#include <string>

#include <tarnik/crypto/data_signature.h>

#include "gate/gate_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using Tarnik::Crypto::SignatureAlgorithm;

class GateMessagesTest : public GateFixture {
 protected:
  static Presenter Signing(const std::string& data, const std::string& signedData,
                           const DevSts::Credential& credential) {
    const auto key = Tarnik::Crypto::CreatePrivateKeyFromPem(credential.privateKeyPem);
    const auto algorithm = SignatureAlgorithm::kEcdsaSha256;
    return Presenter::WithSignature(data, Tarnik::Crypto::SignData(*key, algorithm, signedData),
                                    algorithm);
  }
  std::string PossessionOf(const Presenter& presenter) const {
    return RecordOf(Check(HolderOfKeyText(), presenter), CheckKind::kPossession).compared;
  }
  // After "...the token's key is that of HOLDER; ".
  std::string ProofOf(const Presenter& presenter) const {
    const std::string possession = PossessionOf(presenter);
    return possession.substr(possession.find("; ") + 2);
  }
};

TEST_F(GateMessagesTest, SignatureThatVerifies) {
  EXPECT_EQ(ProofOf(Signing("challenge", "challenge", HolderCredential())),
            "the presenter's signature is one of ECDSA with SHA-256 over 9 bytes, which verifies "
            "with that key");
}

TEST_F(GateMessagesTest, SignatureOfAPassedCheckVerifies) {
  config.longestLifetime = std::chrono::seconds(1);
  const Verdict verdict =
      Check(HolderOfKeyText(), Signing("challenge", "challenge", HolderCredential()));
  ExpectRefused(verdict, Reason::kTooLongLived, CheckKind::kLifetime);
  const std::string proof = RecordOf(verdict, CheckKind::kPossession).compared;
  EXPECT_NE(proof.find("over 9 bytes, which verifies with that key"), std::string::npos) << proof;
}

TEST_F(GateMessagesTest, SignatureOfOthers) {
  const std::string proof =
      "the presenter's signature is one of ECDSA with SHA-256 over 9 bytes: it does not verify "
      "with that key";
  EXPECT_EQ(ProofOf(Signing("challenge", "challenge", OtherHolderCredential())), proof);
  EXPECT_EQ(ProofOf(Signing("challenge", "challengE", HolderCredential())), proof);
}

TEST_F(GateMessagesTest, SignatureOfNothing) {
  EXPECT_EQ(ProofOf(Signing("", "", HolderCredential())),
            "the presenter's signature is one of ECDSA with SHA-256 over 0 bytes: the data is "
            "empty");
}

TEST_F(GateMessagesTest, EmptySignature) {
  EXPECT_EQ(ProofOf(Presenter::WithSignature("challenge", {}, SignatureAlgorithm::kEcdsaSha256)),
            "the presenter's signature is one of ECDSA with SHA-256 over 9 bytes: the signature is "
            "empty");
}

// With a message of the platform, which is a sentence.
TEST_F(GateMessagesTest, OneFullStop) {
  const Verdict wrongKey =
      Check(HolderOfKeyText(),
            Presenter::WithSignature("challenge", {1, 2, 3}, SignatureAlgorithm::kRsaPssSha256));
  for (const Verdict& verdict :
       {wrongKey, Check(std::string("<a/>")), Check(std::string("<a>")), Check(std::string())}) {
    const std::string& message = verdict.Message();
    EXPECT_EQ(message.back(), '.') << message;
    EXPECT_NE(message[message.size() - 2], '.') << message;
  }
}

TEST_F(GateMessagesTest, Proofs) {
  const std::string missing = Check(HolderOfKeyText()).Message();
  EXPECT_EQ(missing.rfind("The presenter has given no proof of possession of the token's key: ", 0),
            0U)
      << missing;
  const std::string wrong =
      Check(HolderOfKeyText(), Signing("challenge", "challengE", HolderCredential())).Message();
  EXPECT_EQ(wrong.rfind("The presenter has not proved possession of the token's key: ", 0), 0U)
      << wrong;
}

TEST_F(GateMessagesTest, Bearer) {
  config.bearerTokens = BearerTokens::kRefuse;
  EXPECT_EQ(Check(text).Message(), "The token is a bearer token, which this service refuses.");
}

TEST_F(GateMessagesTest, UnknownIssuer) {
  trust->Set({});
  EXPECT_EQ(Check(text).Message(),
            "Nobody is trusted to sign tokens of this issuer: 'https://sts.example.com/STS'; no "
            "signer is trusted.");
}

// The usual cause is a name that differs by a slash.
TEST_F(GateMessagesTest, UnknownIssuerBesideTheKnownOnes) {
  const Signer signer = SignerOf(TrustedCredential());
  trust->Set({{"https://sts.example.com/STS/", {signer}},
              {"https://empty.example", {}},
              {"https://sts.example.com", {signer}}});
  const Verdict verdict = Check(text);
  const std::string both =
      "'https://sts.example.com/STS'; signers are trusted for 'https://sts.example.com', "
      "'https://sts.example.com/STS/'";
  EXPECT_EQ(verdict.Message(), "Nobody is trusted to sign tokens of this issuer: " + both + ".");
  EXPECT_EQ(RecordOf(verdict, CheckKind::kSignerKnown).compared, "issuer " + both);
}

TEST_F(GateMessagesTest, Unrestricted) {
  AssertionText changed = text;
  const std::size_t begin = changed.conditions.find("<saml2:AudienceRestriction>");
  const std::string end = "</saml2:AudienceRestriction>";
  changed.conditions.erase(begin, changed.conditions.find(end) + end.size() - begin);
  EXPECT_EQ(Check(changed).Message(),
            "The token is not restricted to audiences; this service is 'https://a.example'.");
}

TEST_F(GateMessagesTest, PredicateThatThrows) {
  config.predicate = [](const SamlToken&, std::string&) -> bool {
    throw std::runtime_error("the deny list is not there");
  };
  const Verdict verdict = Check(text);
  EXPECT_EQ(verdict.Message(),
            "The service's own rule threw an exception: the deny list is not there.");
  EXPECT_EQ(RecordOf(verdict, CheckKind::kPredicate).compared,
            "threw an exception: the deny list is not there");
  config.predicate = [](const SamlToken&, std::string&) -> bool { throw std::runtime_error(""); };
  EXPECT_EQ(Check(text).Message(), "The service's own rule threw an exception.");
  config.predicate = [](const SamlToken&, std::string&) -> bool { throw 7; };
  EXPECT_EQ(Check(text).Message(),
            "The service's own rule threw an exception: one that is not a std::exception.");
}

TEST_F(GateMessagesTest, PredicateWithoutAReason) {
  config.predicate = [](const SamlToken&, std::string&) { return false; };
  const Verdict verdict = Check(text);
  EXPECT_EQ(verdict.Message(), "The service's own rule refuses the token.");
  EXPECT_EQ(RecordOf(verdict, CheckKind::kPredicate).compared, "refused without a reason");
}

}  // namespace
}  // namespace SsoClient::Access::Testing
