// What verdicts say, and what they do not say.
#include <string>
#include <vector>

#include "gate/gate_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using std::chrono::hours;

// The content of the only element with this name, whatever its prefix.
std::string ContentOf(const std::string& xml, const std::string& name) {
  const std::size_t begin = xml.find('>', xml.find(name)) + 1;
  return xml.substr(begin, xml.find('<', begin) - begin);
}

std::string Without(std::string text, const std::vector<std::string>& parts) {
  for (const std::string& part : parts) {
    for (std::size_t at = text.find(part); at != std::string::npos; at = text.find(part)) {
      text.replace(at, part.size(), "\n");
    }
  }
  return text;
}

bool ContainsPartOf(const std::string& text, const std::string& secret) {
  constexpr std::size_t kWindow = 40;
  for (std::size_t i = 0; i + kWindow <= secret.size(); ++i) {
    if (text.find(secret.substr(i, kWindow)) != std::string::npos) {
      return true;
    }
  }
  return false;
}

class GateTextsTest : public GateFixture {
 protected:
  // Of the text of the token, the verdict contains only names, times and URIs.
  static void ExpectNoSecrets(const Verdict& verdict, const std::string& xml) {
    const std::string text = verdict.ToString();
    for (const char* name : {"SignatureValue", "DigestValue", "X509Certificate"}) {
      const std::string value = ContentOf(xml, name);
      ASSERT_GT(value.size(), 40U) << name;
      EXPECT_EQ(text.find(value.substr(0, 20)), std::string::npos) << name;
      EXPECT_EQ(text.find(value.substr(value.size() - 20)), std::string::npos) << name;
    }
    const std::string rest =
        Without(text, {"http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256", kTokenIssuer});
    EXPECT_FALSE(ContainsPartOf(rest, xml)) << text;
  }
};

TEST_F(GateTextsTest, AcceptedToken) {
  const std::string xml = Signed(HolderOfKeyText());
  const auto gate = Make();
  const auto presenter = Presenter::WithTlsCertificate(CertificateOf(HolderCredential()));
  ExpectNoSecrets(gate->Check(xml, presenter), xml);
  ExpectNoSecrets(gate->Check(xml, presenter), xml);
}

TEST_F(GateTextsTest, RefusedTokens) {
  const std::string xml = Signed(text);
  ExpectNoSecrets(Check(Replaced(xml, "alice@", "admin@")), xml);
  ExpectNoSecrets(Check(xml + "<"), xml);
  ExpectNoSecrets(Check(Replaced(xml, "</saml2:Subject>", "")), xml);
  ExpectNoSecrets(Check(Replaced(xml, "<saml2:Subject>", "<saml2:Issuer>")), xml);
  for (std::size_t i = 50; i < xml.size(); i += 50) {
    ExpectNoSecrets(Check(xml.substr(0, i)), xml);
    ExpectNoSecrets(Check(std::string(xml).insert(i, "<x>")), xml);
  }
}

TEST_F(GateTextsTest, SignatureInPlaceOfAName) {
  AssertionText changed = text;
  const std::string value(200, 'A');
  changed.subject = Replaced(changed.subject, "alice@example.com", value);
  EXPECT_LT(Check(changed).Message().size(), 500U);
}

// Names of people and certificates are what a log needs.
TEST_F(GateTextsTest, NamesEachPart) {
  const Verdict verdict =
      Check(HolderOfKeyText(), Presenter::WithTlsCertificate(CertificateOf(HolderCredential())));
  const auto compared = [&verdict](CheckKind check) { return RecordOf(verdict, check).compared; };
  const std::string signer = SignerOf(TrustedCredential()).name;
  const std::string holder =
      "'CN=holder' (SHA-256 " +
      Tarnik::Crypto::FingerprintText(*CertificateOf(HolderCredential())).substr(0, 23) + "...)";
  EXPECT_EQ(compared(CheckKind::kLayout),
            "assertion '_a1' of 'https://sts.example.com/STS' about 'alice@example.com'");
  EXPECT_EQ(compared(CheckKind::kValidity), "from " +
                                                After(start, std::chrono::minutes(-1)).ToString() +
                                                " to " + After(start, hours(1)).ToString() +
                                                ", now " + start.ToString() + ", tolerance 300 s");
  EXPECT_EQ(compared(CheckKind::kSignerKnown),
            "issuer 'https://sts.example.com/STS'; of 1 that may sign for it, the token may mean " +
                signer);
  EXPECT_EQ(compared(CheckKind::kSignerRevoked), signer + ": revocation is not checked");
  EXPECT_EQ(compared(CheckKind::kAudience),
            "restricted to 'https://a.example', which this service is");
  EXPECT_EQ(compared(CheckKind::kConfirmation), "holder-of-key");
  EXPECT_EQ(compared(CheckKind::kPossession), "the token's key is that of " + holder +
                                                  "; the presenter's TLS certificate is " + holder);
  EXPECT_EQ(compared(CheckKind::kLifetime), "3660 s, at most 2678400 s");
  EXPECT_EQ(compared(CheckKind::kDelegation), "0 delegates, at most 10");
  EXPECT_EQ(compared(CheckKind::kGroups), "no group is required");
  EXPECT_EQ(compared(CheckKind::kPredicate), "no predicate");
}

TEST_F(GateTextsTest, OneDelegate) {
  AssertionText changed = text;
  changed.Delegate();
  const std::string end = "</del:Delegate>";
  const std::size_t first = changed.conditions.find("<del:Delegate ");
  changed.conditions.erase(first, changed.conditions.find(end) + end.size() - first);
  EXPECT_EQ(RecordOf(Check(changed), CheckKind::kDelegation).compared,
            "1 delegate, at most 10: 'second@example.com'");
}

TEST_F(GateTextsTest, RefusalSaysBothSides) {
  config.audiences = {"https://c.example", "https://d.example", "https://e.example",
                      "https://f.example", "https://g.example"};
  EXPECT_EQ(Check(text).Message(),
            "The token is restricted to other audiences: 'https://a.example', 'https://b.example'; "
            "this service is 'https://c.example', 'https://d.example', "
            "'https://e.example', 'https://f.example' and 1 more.");
}

TEST_F(GateTextsTest, RevokedSignerIsNamed) {
  Signer signer = SignerOf(TrustedCredential());
  signer.isRevocationChecked = true;
  signer.revokedSince = start;
  Trust(signer);
  EXPECT_EQ(RecordOf(Check(text), CheckKind::kSignerRevoked).compared,
            signer.name + ": revoked since " + start.ToString());
}

// Names may be as long as their author likes.
TEST_F(GateTextsTest, LongNames) {
  const std::string longName(5000, 'n');
  AssertionText changed = text;
  changed.issuer = Replaced(changed.issuer, kTokenIssuer, longName);
  changed.conditions = Replaced(changed.conditions, "https://a.example", std::string(5000, 'a'));
  changed.conditions = Replaced(changed.conditions, "https://b.example", std::string(5000, 'b'));
  changed.subject = Replaced(changed.subject, "alice@", longName + "@");
  trust->Set({{longName, {SignerOf(TrustedCredential())}}});
  ExpectRefused(Check(changed), Reason::kWrongAudience, CheckKind::kAudience);
  config.audiences = {std::string(5000, 'a')};
  ExpectAccepted(Check(changed));
}

TEST_F(GateTextsTest, FirstLineIsTheDecision) {
  EXPECT_EQ(Check(text).ToString().substr(0, 9), "accepted\n");
  config.name = "orders";
  EXPECT_EQ(Check(text).ToString().substr(0, 17), "orders: accepted\n");
  config.largestToken = 1;
  EXPECT_EQ(Check("<a>").ToString().substr(0, 79),
            "orders: refused (too-large): The token is too large: 3 bytes, at most 1.\n  size");
}

}  // namespace
}  // namespace SsoClient::Access::Testing
