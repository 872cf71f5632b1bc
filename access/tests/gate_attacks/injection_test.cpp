// Texts of tokens and certificates in the texts of a verdict, which are written to logs.
#include <algorithm>
#include <stdexcept>

#include "gate_attacks/attack_fixture.h"
#include "support/test_pki.h"

namespace SsoClient::Access::Testing {
namespace {

using Tarnik::Testing::Identity;

// A line feed, the introducer of terminal sequences (C1), a quote, markup and DEL.
const std::string kForged =
    "x&#10;refused (none): accepted&#13;&#9;&#x9B;2J&#x85;&#x7F;'&quot;&lt;/&gt;";

// No byte of these is a control character of C0 or C1 or DEL in UTF-8 (RFC 3629).
bool IsOneLine(const std::string& text) {
  for (std::size_t i = 0; i < text.size(); ++i) {
    const auto byte = static_cast<unsigned char>(text[i]);
    const bool isC1 =
        byte == 0xC2 && i + 1 < text.size() && static_cast<unsigned char>(text[i + 1]) < 0xA0;
    if (byte < 0x20 || byte == 0x7F || isC1) {
      return false;
    }
  }
  return true;
}

class InjectionTest : public AttackFixture {
 protected:
  static void ExpectSafe(const Verdict& verdict) {
    const std::vector<CheckRecord> ledger = verdict.Ledger();
    for (const CheckRecord& record : ledger) {
      EXPECT_TRUE(IsOneLine(record.compared)) << record.compared;
      EXPECT_LE(record.compared.size(), 1000U) << record.compared;
    }
    EXPECT_TRUE(IsOneLine(verdict.Message())) << verdict.Message();
    EXPECT_LE(verdict.Message().size(), 1000U);
    const std::string text = verdict.ToString();
    EXPECT_EQ(std::count(text.begin(), text.end(), '\n'),
              static_cast<std::ptrdiff_t>(ledger.size()) + 1)
        << text;
  }
  /// The same for the token whose verdict is this.
  void ExpectSafe(Reason reason, const AssertionText& token,
                  const Presenter& presenter = Presenter::Nobody()) const {
    const Verdict verdict = Check(Signed(token), presenter);
    EXPECT_EQ(verdict.Refusal(), reason) << verdict.ToString();
    ExpectSafe(verdict);
  }
};

std::string With(const std::string& part, const std::string& from, const std::string& forged) {
  return Replaced(part, from, forged + from);
}

const std::string kLong(50'000, 'x');

TEST_F(InjectionTest, TextsOfTheTokenStayInTheirLine) {
  ExpectSafe(Reason::kNone, text);
  for (const std::string& forged : {kForged, kLong, kLong + kForged}) {
    AssertionText changed = text;
    changed.issuer = With(changed.issuer, kTokenIssuer, forged);
    ExpectSafe(Reason::kUnknownIssuer, changed);
    changed = text;
    changed.conditions = With(changed.conditions, "https://a.example", forged);
    changed.conditions = With(changed.conditions, "https://b.example", forged);
    ExpectSafe(Reason::kWrongAudience, changed);
    changed = text;
    changed.subject = With(changed.subject, "alice@example.com", forged);
    ExpectSafe(Reason::kNone, changed);
    changed = AssertionText(text).Delegate();
    changed.conditions = With(changed.conditions, "first@example.com", forged);
    ExpectSafe(Reason::kNone, changed);
    changed = text;
    changed.attributes = With(changed.attributes, "\" IssueInstant", forged);
    changed.signature = SsoClient::Testing::MadeUpSignature("#_a1" + forged);
    const Verdict unsignedOne = Check(changed.ToXml());
    EXPECT_EQ(unsignedOne.Refusal(), Reason::kBadSignature);
    ExpectSafe(unsignedOne);
  }
}

TEST_F(InjectionTest, GroupsStayInTheirLine) {
  config.allowedGroups = {PrincipalId{"nobody", "EXAMPLE"}};
  for (const std::string& forged : {std::string(), kForged, kLong}) {
    AssertionText changed = text;
    changed.attributeStatement = With(changed.attributeStatement, "staff", forged);
    ExpectSafe(Reason::kNotInGroup, changed);
  }
}

TEST_F(InjectionTest, FaultsOfTheTokenStayInTheirLine) {
  for (const std::string& forged : {kForged, kLong}) {
    AssertionText changed = text;
    changed.attributes = Replaced(changed.attributes, "\"2.0", "\"" + forged + "2.0");
    ExpectSafe(Reason::kBadLayout, changed);
    changed = text;
    changed.conditions = Replaced(changed.conditions, "rsa:RenewRestrictionType", "rsa:" + forged);
    ExpectSafe(Reason::kBadLayout, changed);
  }
  const std::string name = "<a" + kLong + "/>";
  const std::string element = "<\xC2\x9B/>";
  for (const std::string& broken :
       {name, element, std::string("<a\n\x1B[2J"), "<a>\n" + kLong, std::string("\x1B]0;t\x07"),
        std::string("<?xml version='1.0' encoding='\x1B[2J\n'?><a/>")}) {
    const Verdict verdict = Check(broken);
    EXPECT_FALSE(verdict.IsAccepted());
    ExpectSafe(verdict);
  }
}

TEST_F(InjectionTest, AlgorithmsStayInTheirLine) {
  for (const std::string& forged : {kForged, kLong}) {
    const std::string token =
        Replaced(Signed(text), "\"http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256\"",
                 "\"" + forged + "\"");
    const Verdict verdict = Check(token);
    EXPECT_EQ(verdict.Refusal(), Reason::kBadSignature);
    ExpectSafe(verdict);
  }
}

// Names of certificates are not restricted to characters of XML.
TEST_F(InjectionTest, NamesOfCertificatesStayInTheirLine) {
  const std::string plain = config.trust->Describe().ToString();
  const auto lines = std::count(plain.begin(), plain.end(), '\n');
  for (const std::string& name : {std::string("STS"), std::string("a\nb\x1B[2J\x07\"'\\,+=<>#;"),
                                  std::string("\xC2\x9B"
                                              "2J"),
                                  std::string(60, '\n')}) {
    const Identity identity = Tarnik::Testing::MakeIdentity({.commonName = name}, nullptr);
    Trust({identity.ToCertificate()});
    const AssertionText bound = AssertionText(text).ConfirmByKey(identity.Pem());
    const std::string token = bound.ToSignedXml({identity.Pem(), identity.KeyPem()});
    const Presenter same = Presenter::WithTlsCertificate(identity.ToCertificate());
    ExpectAccepted(Check(token, same));
    ExpectSafe(Check(token, same));
    const Verdict other = Check(token, WithTls(OtherHolderCredential()));
    EXPECT_EQ(other.Refusal(), Reason::kWrongProof);
    ExpectSafe(other);
    std::string described = config.trust->Describe().ToString();
    EXPECT_EQ(std::count(described.begin(), described.end(), '\n'), lines) << described;
    std::replace(described.begin(), described.end(), '\n', ' ');
    EXPECT_TRUE(IsOneLine(described)) << described;
  }
}

TEST_F(InjectionTest, TextsOfThePredicateStayInTheirLine) {
  config.predicate = [](const SamlToken&, std::string& why) {
    why = "line\nfeed \x1B[2J \xC2\x9B " + kLong;
    return false;
  };
  ExpectSafe(Reason::kRefusedByPredicate, text);
  config.predicate = [](const SamlToken&, std::string&) -> bool {
    throw std::runtime_error("line\nfeed \x1B[2J" + kLong);
  };
  ExpectSafe(Reason::kPredicateFailed, text);
  config.predicate = nullptr;
  ExpectSafe(Reason::kNone, text);
}

// Nothing that would let a reader of the log present the token.
TEST_F(InjectionTest, NoTextContainsTheTokenOrASignature) {
  const std::string token = Signed(HolderOfKeyText());
  const auto valueOf = [&token](const std::string& name) {
    const std::size_t begin = token.find("<ds:" + name + ">") + name.size() + 5;
    return token.substr(begin, token.find('<', begin) - begin);
  };
  for (const Presenter& presenter :
       {WithTls(HolderCredential()), WithTls(OtherHolderCredential()), Presenter::Nobody()}) {
    for (const std::string& presented :
         {token, token + "<", Replaced(token, "alice@", "admin@"), token.substr(1)}) {
      const std::string texts = Check(presented, presenter).ToString();
      for (const std::string& value : {valueOf("SignatureValue"), valueOf("DigestValue")}) {
        ASSERT_GT(value.size(), 40U);
        for (std::size_t at = 0; at + 8 <= value.size(); at += 8) {
          EXPECT_EQ(texts.find(value.substr(at, 8)), std::string::npos) << texts;
        }
      }
      EXPECT_EQ(texts.find("<saml2:"), std::string::npos);
    }
  }
}

}  // namespace
}  // namespace SsoClient::Access::Testing
