// Each reason of a refusal, and a token that is accepted and differs in nothing else.
#include <stdexcept>

#include <tarnik/crypto/data_signature.h>

#include "gate/gate_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using std::chrono::hours;
using std::chrono::seconds;
using Tarnik::Crypto::SignatureAlgorithm;

class GateReasonsTest : public GateFixture {
 protected:
  static Presenter Tls(const DevSts::Credential& credential) {
    return Presenter::WithTlsCertificate(CertificateOf(credential));
  }
  static Presenter Signing(const std::string& data, const std::string& signedData,
                           const DevSts::Credential& credential) {
    const auto key = Tarnik::Crypto::CreatePrivateKeyFromPem(credential.privateKeyPem);
    const auto algorithm = SignatureAlgorithm::kEcdsaSha256;
    return Presenter::WithSignature(data, Tarnik::Crypto::SignData(*key, algorithm, signedData),
                                    algorithm);
  }
};

TEST_F(GateReasonsTest, None) {
  const Verdict verdict = Check(text);
  ExpectAccepted(verdict);
  EXPECT_EQ(verdict.Token()->Subject(), (PrincipalId{"alice", "example.com"}));
}

TEST_F(GateReasonsTest, TooLarge) {
  const std::string xml = Signed(text);
  config.largestToken = xml.size();
  ExpectAccepted(Check(xml));
  config.largestToken = xml.size() - 1;
  ExpectRefused(Check(xml), Reason::kTooLarge, CheckKind::kSize);
}

TEST_F(GateReasonsTest, NotWellFormed) {
  ExpectRefused(Check(Signed(text) + "<"), Reason::kNotWellFormed, CheckKind::kWellFormed);
  ExpectRefused(Check(std::string()), Reason::kNotWellFormed, CheckKind::kWellFormed);
  ExpectRefused(Check(std::string(1000, '\0')), Reason::kNotWellFormed, CheckKind::kWellFormed);
}

TEST_F(GateReasonsTest, BadLayout) {
  ExpectRefused(Check(std::string("<a/>")), Reason::kBadLayout, CheckKind::kLayout);
  AssertionText changed = text;
  changed.attributes = Replaced(changed.attributes, "\"2.0\"", "\"2.1\"");
  ExpectRefused(Check(changed), Reason::kBadLayout, CheckKind::kLayout);
}

TEST_F(GateReasonsTest, HolderCertificateThatCannotBeDecoded) {
  AssertionText changed = HolderOfKeyText();
  const std::string body = SsoClient::Testing::CertificateBody(HolderCredential().certificatePem);
  ExpectAccepted(Check(changed, Tls(HolderCredential())));
  changed.subject = Replaced(changed.subject, body, "AAAA");
  ExpectRefused(Check(changed), Reason::kBadLayout, CheckKind::kLayout);
  changed.subject = Replaced(changed.subject, "AAAA", "A");
  ExpectRefused(Check(changed), Reason::kBadLayout, CheckKind::kLayout);
}

TEST_F(GateReasonsTest, NotYetValid) {
  const std::string xml = Signed(AssertionText(After(start, hours(1))));
  ExpectRefused(Check(xml), Reason::kNotYetValid, CheckKind::kValidity);
  now = After(start, hours(1));
  ExpectAccepted(Check(xml));
}

TEST_F(GateReasonsTest, Expired) {
  const std::string xml = Signed(AssertionText(After(start, hours(-2))));
  ExpectRefused(Check(xml), Reason::kExpired, CheckKind::kValidity);
  now = After(start, -hours(1) - seconds(1));
  Signer signer = SignerOf(TrustedCredential());
  signer.notBefore = After(start, hours(-3));
  Trust(signer);
  ExpectAccepted(Check(xml));
}

TEST_F(GateReasonsTest, UnknownIssuer) {
  AssertionText changed = text;
  changed.issuer = Replaced(changed.issuer, kTokenIssuer, "https://sts.example.com/sts");
  ExpectRefused(Check(changed), Reason::kUnknownIssuer, CheckKind::kSignerKnown);
  trust->Set({{"https://sts.example.com/sts", {SignerOf(TrustedCredential())}}});
  ExpectAccepted(Check(changed));
}

TEST_F(GateReasonsTest, UnknownSigner) {
  const std::string xml = text.ToSignedXml(StrangerCredential());
  ExpectRefused(Check(xml), Reason::kUnknownSigner, CheckKind::kSignerKnown);
  Trust(SignerOf(StrangerCredential()));
  ExpectAccepted(Check(xml));
}

TEST_F(GateReasonsTest, SignerOfAnotherIssuer) {
  trust->Set({{kTokenIssuer, {SignerOf(StrangerCredential())}},
              {"https://other.example.com", {SignerOf(TrustedCredential())}}});
  ExpectRefused(Check(text), Reason::kUnknownSigner, CheckKind::kSignerKnown);
}

TEST_F(GateReasonsTest, SignerNotYetValid) {
  Signer signer = SignerOf(TrustedCredential());
  signer.notBefore = After(start, hours(1));
  Trust(signer);
  ExpectRefused(Check(text), Reason::kSignerNotYetValid, CheckKind::kSignerValid);
}

TEST_F(GateReasonsTest, SignerExpired) {
  Signer signer = SignerOf(TrustedCredential());
  signer.notAfter = After(start, hours(-1));
  Trust(signer);
  ExpectRefused(Check(text), Reason::kSignerExpired, CheckKind::kSignerValid);
}

TEST_F(GateReasonsTest, SignerRevoked) {
  Signer signer = SignerOf(TrustedCredential());
  signer.isRevocationChecked = true;
  signer.listFrom = After(start, hours(-1));
  signer.listUntil = After(start, hours(1));
  Trust(signer);
  ExpectAccepted(Check(text));
  // Also in the future, and when the list is out of date.
  for (const hours since : {hours(-1), hours(24)}) {
    signer.revokedSince = After(start, since);
    Trust(signer);
    ExpectRefused(Check(text), Reason::kSignerRevoked, CheckKind::kSignerRevoked);
  }
  signer.listUntil = After(start, hours(-1));
  Trust(signer);
  ExpectRefused(Check(text), Reason::kSignerRevoked, CheckKind::kSignerRevoked);
}

TEST_F(GateReasonsTest, RevocationUnknown) {
  Signer signer = SignerOf(TrustedCredential());
  signer.isRevocationChecked = true;
  Trust(signer);
  ExpectRefused(Check(text), Reason::kRevocationUnknown, CheckKind::kSignerRevoked);
  signer.listFrom = After(start, hours(-2));
  signer.listUntil = After(start, hours(-1));
  Trust(signer);
  ExpectRefused(Check(text), Reason::kRevocationUnknown, CheckKind::kSignerRevoked);
}

TEST_F(GateReasonsTest, BadSignature) {
  const std::string xml = Signed(text);
  ExpectAccepted(Check(xml));
  ExpectRefused(Check(Replaced(xml, "alice@", "admin@")), Reason::kBadSignature,
                CheckKind::kSignature);
}

// The stranger claims to have the trusted certificate.
TEST_F(GateReasonsTest, KeyThatIsNotTheSigners) {
  const std::string xml =
      text.ToSignedXml({TrustedCredential().certificatePem, StrangerCredential().privateKeyPem});
  ExpectRefused(Check(xml), Reason::kBadSignature, CheckKind::kSignature);
}

TEST_F(GateReasonsTest, WrongAudience) {
  for (const char* audience : {"https://a.example.com", "https://a.exampl", "https://A.example",
                               "https://a.example/", " https://a.example", "https://a.example "}) {
    config.audiences = {audience};
    ExpectRefused(Check(text), Reason::kWrongAudience, CheckKind::kAudience);
  }
  config.audiences = {"https://c.example", kAudience};
  ExpectAccepted(Check(text));
}

TEST_F(GateReasonsTest, Unrestricted) {
  AssertionText changed = text;
  const std::size_t begin = changed.conditions.find("<saml2:AudienceRestriction>");
  const std::string end = "</saml2:AudienceRestriction>";
  changed.conditions.erase(begin, changed.conditions.find(end) + end.size() - begin);
  ExpectRefused(Check(changed), Reason::kUnrestricted, CheckKind::kAudience);
  config.acceptsUnrestrictedTokens = true;
  ExpectAccepted(Check(changed));
  // This is not for tokens that are restricted to others.
  config.audiences = {"https://c.example"};
  ExpectRefused(Check(text), Reason::kWrongAudience, CheckKind::kAudience);
}

TEST_F(GateReasonsTest, BearerRefused) {
  config.bearerTokens = BearerTokens::kRefuse;
  ExpectRefused(Check(text), Reason::kBearerRefused, CheckKind::kConfirmation);
  ExpectRefused(Check(text, Tls(HolderCredential())), Reason::kBearerRefused,
                CheckKind::kConfirmation);
  ExpectAccepted(Check(HolderOfKeyText(), Tls(HolderCredential())));
}

TEST_F(GateReasonsTest, BearerWithCertificateThatIsNotCompared) {
  const Verdict verdict = Check(text, Tls(HolderCredential()));
  ExpectAccepted(verdict);
  EXPECT_NE(RecordOf(verdict, CheckKind::kConfirmation).compared.find("not compared"),
            std::string::npos);
  EXPECT_EQ(RecordOf(Check(text), CheckKind::kConfirmation).compared.find("not compared"),
            std::string::npos);
}

TEST_F(GateReasonsTest, NoProof) {
  ExpectRefused(Check(HolderOfKeyText()), Reason::kNoProof, CheckKind::kPossession);
  ExpectRefused(Check(HolderOfKeyText(), Presenter::WithTlsCertificate(nullptr)), Reason::kNoProof,
                CheckKind::kPossession);
}

TEST_F(GateReasonsTest, WrongTlsCertificate) {
  ExpectRefused(Check(HolderOfKeyText(), Tls(OtherHolderCredential())), Reason::kWrongProof,
                CheckKind::kPossession);
  ExpectAccepted(Check(HolderOfKeyText(), Tls(HolderCredential())));
}

TEST_F(GateReasonsTest, WrongSignatureOfData) {
  const Verdict accepted =
      Check(HolderOfKeyText(), Signing("challenge", "challenge", HolderCredential()));
  ExpectAccepted(accepted);
  ExpectRefused(Check(HolderOfKeyText(), Signing("challenge", "challengE", HolderCredential())),
                Reason::kWrongProof, CheckKind::kPossession);
  ExpectRefused(
      Check(HolderOfKeyText(), Signing("challenge", "challenge", OtherHolderCredential())),
      Reason::kWrongProof, CheckKind::kPossession);
  // Of nothing that the server could have chosen.
  ExpectRefused(Check(HolderOfKeyText(), Signing("", "", HolderCredential())), Reason::kWrongProof,
                CheckKind::kPossession);
  // An algorithm that does not fit the key is an exception of the platform.
  const Verdict verdict =
      Check(HolderOfKeyText(),
            Presenter::WithSignature("challenge", {1, 2, 3}, SignatureAlgorithm::kRsaPssSha256));
  ExpectRefused(verdict, Reason::kWrongProof, CheckKind::kPossession);
  ExpectRefused(Check(HolderOfKeyText(), Presenter::WithSignature(
                                             "challenge", {}, static_cast<SignatureAlgorithm>(99))),
                Reason::kWrongProof, CheckKind::kPossession);
}

TEST_F(GateReasonsTest, TooLongLived) {
  config.longestLifetime = seconds(3660);
  ExpectAccepted(Check(text));
  config.longestLifetime = seconds(3659);
  ExpectRefused(Check(text), Reason::kTooLongLived, CheckKind::kLifetime);
}

TEST_F(GateReasonsTest, ValidForACentury) {
  AssertionText changed = text;
  const std::string end = SsoClient::Testing::TimeText(start, 3600);
  const std::string later = SsoClient::Testing::TimeText(start, 100L * 365 * 86400);
  changed.conditions = Replaced(changed.conditions, end, later);
  changed.subject = Replaced(changed.subject, end, later);
  ExpectRefused(Check(changed), Reason::kTooLongLived, CheckKind::kLifetime);
  config.longestLifetime = hours(101 * 365 * 24);
  ExpectAccepted(Check(changed));
}

TEST_F(GateReasonsTest, TooDeeplyDelegated) {
  AssertionText changed = text;
  changed.Delegate();
  config.deepestDelegation = 2;
  ExpectAccepted(Check(changed));
  config.deepestDelegation = 1;
  ExpectRefused(Check(changed), Reason::kTooDeeplyDelegated, CheckKind::kDelegation);
}

TEST_F(GateReasonsTest, DelegatedFiftyTimes) {
  AssertionText changed = text;
  changed.Delegate();
  const std::size_t begin = changed.conditions.find("<del:Delegate ");
  const std::string end = "</del:Delegate>";
  const std::string first =
      changed.conditions.substr(begin, changed.conditions.find(end) + end.size() - begin);
  for (int i = 0; i < 48; ++i) {
    changed.conditions.insert(begin, first);
  }
  ExpectRefused(Check(changed), Reason::kTooDeeplyDelegated, CheckKind::kDelegation);
  config.deepestDelegation = 50;
  ExpectAccepted(Check(changed));
}

TEST_F(GateReasonsTest, NotInGroup) {
  config.allowedGroups = {{"guests", "EXAMPLE"}, {"staff", "OTHER"}};
  ExpectRefused(Check(text), Reason::kNotInGroup, CheckKind::kGroups);
  config.allowedGroups.push_back({"Staff", "example"});
  const Verdict verdict = Check(text);
  ExpectAccepted(verdict);
  EXPECT_EQ(RecordOf(verdict, CheckKind::kGroups).compared, "in 'Staff@example'");
}

TEST_F(GateReasonsTest, RefusedByPredicate) {
  bool isWelcome = true;
  config.predicate = [&isWelcome](const SamlToken& token, std::string& why) {
    why = token.Subject().name + "\nis not on duty";
    return isWelcome;
  };
  ExpectAccepted(Check(text));
  isWelcome = false;
  const Verdict verdict = Check(text);
  ExpectRefused(verdict, Reason::kRefusedByPredicate, CheckKind::kPredicate);
  EXPECT_EQ(verdict.Message(), "alice?is not on duty");
}

TEST_F(GateReasonsTest, PredicateWithManyWordsOrNone) {
  std::string words(1'000'000, 'x');
  config.predicate = [&words](const SamlToken&, std::string& why) {
    why = words;
    return false;
  };
  ExpectRefused(Check(text), Reason::kRefusedByPredicate, CheckKind::kPredicate);
  words.clear();
  ExpectRefused(Check(text), Reason::kRefusedByPredicate, CheckKind::kPredicate);
}

TEST_F(GateReasonsTest, PredicateFailed) {
  config.predicate = [](const SamlToken&, std::string&) -> bool {
    throw std::runtime_error("the database\nis away");
  };
  const Verdict verdict = Check(text);
  ExpectRefused(verdict, Reason::kPredicateFailed, CheckKind::kPredicate);
  EXPECT_NE(verdict.Message().find("the database?is away"), std::string::npos);
  config.predicate = [](const SamlToken&, std::string&) -> bool { throw 7; };
  ExpectRefused(Check(text), Reason::kPredicateFailed, CheckKind::kPredicate);
}

// The first fault decides.
TEST_F(GateReasonsTest, Order) {
  config.audiences = {"https://c.example"};
  config.bearerTokens = BearerTokens::kRefuse;
  config.longestLifetime = seconds(1);
  config.allowedGroups = {{"guests", "EXAMPLE"}};
  config.predicate = [](const SamlToken&, std::string&) { return false; };
  std::string xml = Signed(text);
  Signer signer = SignerOf(TrustedCredential());
  signer.isRevocationChecked = true;
  signer.notAfter = After(start, hours(-1));
  Trust(signer);
  const std::string forged = Replaced(xml, "alice@", "admin@");
  config.largestToken = 10;
  ExpectRefused(Check(forged + "<"), Reason::kTooLarge, CheckKind::kSize);
  config.largestToken = 100'000;
  ExpectRefused(Check(forged + "<"), Reason::kNotWellFormed, CheckKind::kWellFormed);
  now = After(start, hours(2));
  ExpectRefused(Check(forged), Reason::kExpired, CheckKind::kValidity);
  now = start;
  ExpectRefused(Check(forged), Reason::kSignerExpired, CheckKind::kSignerValid);
  signer.notAfter = After(start, hours(1));
  Trust(signer);
  ExpectRefused(Check(forged), Reason::kRevocationUnknown, CheckKind::kSignerRevoked);
  signer.isRevocationChecked = false;
  Trust(signer);
  ExpectRefused(Check(forged), Reason::kBadSignature, CheckKind::kSignature);
  ExpectRefused(Check(xml), Reason::kWrongAudience, CheckKind::kAudience);
  config.audiences = {kAudience};
  ExpectRefused(Check(xml), Reason::kBearerRefused, CheckKind::kConfirmation);
  ExpectRefused(Check(HolderOfKeyText()), Reason::kNoProof, CheckKind::kPossession);
  config.bearerTokens = BearerTokens::kAccept;
  ExpectRefused(Check(xml), Reason::kTooLongLived, CheckKind::kLifetime);
  config.longestLifetime = hours(24);
  config.deepestDelegation = 0;
  ExpectRefused(Check(AssertionText(text).Delegate()), Reason::kTooDeeplyDelegated,
                CheckKind::kDelegation);
  ExpectRefused(Check(xml), Reason::kNotInGroup, CheckKind::kGroups);
  config.allowedGroups.clear();
  ExpectRefused(Check(xml), Reason::kRefusedByPredicate, CheckKind::kPredicate);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
