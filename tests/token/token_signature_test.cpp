#include "token/token_signature.h"

#include <cstddef>
#include <functional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/key_info_resolver.h>
#include <tarnik/xml/security/signature.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "support/assertion_text.h"
#include "support/fragment.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Ref;
using Tarnik::Xml::Security::KeyInfoResolver;
using Tarnik::Xml::Security::Signature;

std::string Refusal(const std::string& content, const std::string& id = "_a1") {
  Fragment fragment(content);
  return ThrownMessage<ParseException>([&] { ReadSignature(fragment.Cursor(), id); });
}

void ExpectCovers(const std::string& content) {
  Fragment fragment(content);
  const Ref<Signature> signature = ReadSignature(fragment.Cursor(), "_a1");
  EXPECT_EQ(signature->Element(), &fragment.Element());
  EXPECT_TRUE(fragment.Cursor().IsAtEnd());
}

std::string WithSecondReference(const std::string& signature, const std::string& uri) {
  const std::size_t begin = signature.find("<ds:Reference ");
  const std::size_t end = signature.find("</ds:SignedInfo>");
  const std::string second =
      MadeUpSignature(uri).substr(begin, MadeUpSignature(uri).find("</ds:SignedInfo>") - begin);
  return signature.substr(0, end) + second + signature.substr(end);
}

TEST(ReadSignatureTest, AcceptsAReferenceToTheAssertionOrTheDocument) {
  ExpectCovers(MadeUpSignature("#_a1"));
  ExpectCovers(MadeUpSignature(""));
}

TEST(ReadSignatureTest, AcceptsOneCoveringReferenceAmongSeveral) {
  ExpectCovers(WithSecondReference(MadeUpSignature("#_a1"), "#other"));
  ExpectCovers(WithSecondReference(MadeUpSignature("#other"), "#_a1"));
}

TEST(ReadSignatureTest, RefusesReferencesToElsewhere) {
  for (const char* uri : {"#other", "#", "_a1", "#_a", "#_a11", "##_a1", "#_A1", "#_a1 ", " #_a1",
                          "x_a1", "?_a1", "#xpointer(id('_a1'))", "#xpointer(/)", "urn:x#_a1"}) {
    EXPECT_EQ(Refusal(MadeUpSignature(uri)), "Token's signature must cover the entire token")
        << uri;
  }
  EXPECT_EQ(Refusal(WithSecondReference(MadeUpSignature("#other"), "#another")),
            "Token's signature must cover the entire token");
}

// The reference "#" is "#" followed by the empty id. Such a token is refused for its id.
TEST(ReadSignatureTest, AcceptsTheEmptyFragmentOnlyForAnEmptyId) {
  Fragment fragment(MadeUpSignature("#"));
  EXPECT_NE(ReadSignature(fragment.Cursor(), ""), nullptr);
  EXPECT_EQ(Refusal(MadeUpSignature("#_a1"), ""), "Token's signature must cover the entire token");
  EXPECT_EQ(Refusal(MadeUpSignature("#"), "_"), "Token's signature must cover the entire token");
}

TEST(ReadSignatureTest, RefusesAnythingButAnElementInItsPlace) {
  for (const char* content : {"", "text", "<?pi?>", " <!--c--> "}) {
    EXPECT_EQ(Refusal(content), "Expected element ds:Signature not found");
  }
}

TEST(ReadSignatureTest, ReportsThePlatformsSyntaxError) {
  const std::string cases[] = {
      "<saml2:Subject/>",
      "<Signature/>",
      "<ds:Signature/>",
      Replaced(Replaced(MadeUpSignature("#_a1"), "<ds:SignatureValue>", ""),
               "AAECAwQF</ds:SignatureValue>", ""),
      Replaced(MadeUpSignature("#_a1"), "<ds:SignatureValue>AA", "<ds:SignatureValue>AA<!---->"),
      Replaced(MadeUpSignature("#_a1"), "<ds:DigestValue>AA", "<ds:DigestValue>AA<!---->")};
  for (const std::string& content : cases) {
    const Fragment fragment(content);
    const std::string fault = ThrownMessage<Tarnik::Xml::Security::SignatureSyntaxException>(
        [&] { Tarnik::Xml::Security::CreateSignatureFromDom(&fragment.Element()); });
    EXPECT_EQ(Refusal(content), "Signature syntax error: " + fault);
  }
}

std::string WithKeyInfo(const std::string& signature, const std::string& content) {
  return Replaced(signature, "</ds:SignatureValue>",
                  "</ds:SignatureValue><ds:KeyInfo>" + content + "</ds:KeyInfo>");
}

TEST(ReadSignatureTest, RefusesSamlElementsAnywhereInKeyInfo) {
  for (const char* content :
       {"<saml2:Assertion/>", "<saml2:Anything/>",
        "<Assertion xmlns=\"urn:oasis:names:tc:SAML:2.0:assertion\"/>",
        "<ds:KeyName>k</ds:KeyName><saml2:Assertion/>",
        "<x>text<!--c--><y><saml2:Assertion/></y></x>", "<x><y/></x><z/><saml2:Assertion/>",
        "<x><y/>text<saml2:Assertion/></x><z/>"}) {
    EXPECT_EQ(Refusal(WithKeyInfo(MadeUpSignature("#_a1"), content)),
              "Token's signature must not hold SAML elements")
        << content;
  }
  for (const char* content :
       {"<ds:KeyName>k</ds:KeyName>", "<Assertion/>", "<x>text<y/><!--c--></x><z><y>t</y></z>",
        "<saml:Assertion xmlns:saml=\"urn:oasis:names:tc:SAML:1.0:assertion\"/>"}) {
    ExpectCovers(WithKeyInfo(MadeUpSignature("#_a1"), content));
  }
}

TEST(ReadSignatureTest, ChecksFormThenCoverageThenKeyInfo) {
  const std::string uncovering = WithKeyInfo(MadeUpSignature("#other"), "<saml2:Assertion/>");
  EXPECT_EQ(Refusal(Replaced(uncovering, "<ds:DigestValue>AA", "<ds:DigestValue>AA<!---->"))
                .rfind("Signature syntax error: ", 0),
            0U);
  EXPECT_EQ(Refusal(uncovering), "Token's signature must cover the entire token");
}

// A signature whose verdict the test sets.
class FakeSignature final : public Signature, public Tarnik::ObjectImpl {
 public:
  explicit FakeSignature(std::function<bool(const KeyInfoResolver*)> verify)
      : verify_(std::move(verify)) {}

  const std::string& CanonicalizationMethod() const override { return text_; }
  const std::string& SignatureMethod() const override { return text_; }
  const std::vector<Tarnik::Xml::Security::Reference>& References() const override {
    return references_;
  }
  const Tarnik::Xml::Security::KeyInfo& KeyInfo() const override { return keyInfo_; }
  Tarnik::Xml::ElementNode* Element() const override { return nullptr; }
  bool Verify(const KeyInfoResolver* resolver) const override { return verify_(resolver); }
  Ref<Tarnik::Xml::Security::SignatureReference> AddReference(std::string_view,
                                                              std::string_view) override {
    return nullptr;
  }
  void SetKeyInfo(Tarnik::Xml::ElementNode*) override {}
  void Sign(const Tarnik::Crypto::PrivateKey*) override {}

 private:
  std::function<bool(const KeyInfoResolver*)> verify_;
  std::string text_;
  std::vector<Tarnik::Xml::Security::Reference> references_;
  Tarnik::Xml::Security::KeyInfo keyInfo_;
};

TEST(VerifySignatureTest, AcceptsATrueVerdictOfTheGivenResolver) {
  const Ref<const KeyInfoResolver> resolver = TrustedResolver();
  const KeyInfoResolver* seen = nullptr;
  const auto signature = Tarnik::MakeRef<FakeSignature>([&](const KeyInfoResolver* given) {
    seen = given;
    return true;
  });
  EXPECT_NO_THROW(VerifySignature(*signature, resolver.get()));
  EXPECT_EQ(seen, resolver.get());
}

TEST(VerifySignatureTest, RefusesAFalseVerdict) {
  const auto signature =
      Tarnik::MakeRef<FakeSignature>([](const KeyInfoResolver*) { return false; });
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>([&] { VerifySignature(*signature, nullptr); }),
            "Failed to verify signature: token might have been tampered with.");
}

TEST(VerifySignatureTest, ReportsThePlatformsError) {
  const auto signature = Tarnik::MakeRef<FakeSignature>([](const KeyInfoResolver*) -> bool {
    throw Tarnik::Xml::Security::XmlSecurityException("no trusted key");
  });
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>([&] { VerifySignature(*signature, nullptr); }),
            "Signature verification error. no trusted key");
}

TEST(VerifySignatureTest, PassesOtherErrorsOn) {
  const auto signature = Tarnik::MakeRef<FakeSignature>([](const KeyInfoResolver*) -> bool {
    throw Tarnik::InvalidStateException("resolver broken");
  });
  EXPECT_EQ(
      ThrownMessage<Tarnik::InvalidStateException>([&] { VerifySignature(*signature, nullptr); }),
      "resolver broken");
}

}  // namespace
}  // namespace SsoClient::Testing
