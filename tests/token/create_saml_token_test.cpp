#include <cstddef>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include <devsts/certificates.h>
#include <devsts/xml_security.h>
#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/key_info_resolver.h>
#include <tarnik/xml/security/xml_security_exception.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "support/assertion_text.h"
#include "support/parse_xml.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Ref;
using Tarnik::Xml::ElementNode;
using Tarnik::Xml::XMLParseException;
using Tarnik::Xml::Security::KeyInfoResolver;

constexpr char kTampered[] = "Failed to verify signature: token might have been tampered with.";

std::string SignedXml(const AssertionText& text = AssertionText()) {
  return text.ToSignedXml(TrustedCredential());
}

std::string TamperedXml() {
  return Replaced(SignedXml(), "alice@example.com", "admin@example.com");
}

TEST(CreateSamlTokenTest, AcceptsASignedToken) {
  const std::string xml = SignedXml();
  const auto resolver = TrustedResolver();
  EXPECT_EQ(CreateSamlToken(xml)->Subject().name, "alice");
  EXPECT_EQ(CreateSamlToken(xml, 600)->Subject().name, "alice");
  EXPECT_EQ(CreateSamlToken(xml, resolver.get())->Subject().name, "alice");
  EXPECT_EQ(CreateSamlToken(xml, resolver.get(), 600)->Subject().name, "alice");
  EXPECT_EQ(CreateSamlToken(xml, [&](const SamlToken*) { return resolver; })->Subject().name,
            "alice");
}

TEST(CreateSamlTokenFromDomTest, AcceptsASignedToken) {
  const auto document = ParseXml(SignedXml());
  const auto resolver = TrustedResolver();
  ElementNode* root = document->RootElement();
  EXPECT_EQ(CreateSamlTokenFromDom(root)->Subject().name, "alice");
  EXPECT_EQ(CreateSamlTokenFromDom(root, 600)->Subject().name, "alice");
  EXPECT_EQ(CreateSamlTokenFromDom(root, resolver.get())->Subject().name, "alice");
  EXPECT_EQ(CreateSamlTokenFromDom(root, resolver.get(), 600)->Subject().name, "alice");
}

TEST(CreateSamlTokenTest, AcceptsAnRsaSignatureOverTheWholeDocument) {
  DevSts::CertificateSpec spec;
  spec.commonName = "RSA STS";
  spec.keyType = DevSts::KeyType::Rsa2048;
  const DevSts::Credential credential = DevSts::MakeCertificate(spec);
  AssertionText text;
  text.signature = Replaced(MadeUpSignature(""), "ecdsa-sha256", "rsa-sha256");
  text.signature = Replaced(text.signature, "AAECAwQFBgcICQoLDA0ODxAREhMUFRYXGBkaGxwdHh8=", "");
  text.signature = Replaced(text.signature, "AAECAwQF", "");
  const std::string xml =
      DevSts::SignXml(text.ToXml(), credential.privateKeyPem, credential.certificatePem);
  const auto resolver = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::CreateCertificatesFromPem(credential.certificatePem));
  EXPECT_EQ(CreateSamlToken(xml, resolver.get())->Subject().name, "alice");
}

// Signed with a reference to the assertion and one to the whole document.
std::string TwiceReferencedXml() {
  AssertionText text;
  std::string& signature = text.signature;
  signature = Replaced(signature, "AAECAwQFBgcICQoLDA0ODxAREhMUFRYXGBkaGxwdHh8=", "");
  signature = Replaced(signature, "AAECAwQF", "");
  const std::size_t begin = signature.find("<ds:Reference ");
  const std::size_t end = signature.find("</ds:SignedInfo>");
  signature.insert(end, Replaced(signature.substr(begin, end - begin), "\"#_a1\"", "\"\""));
  const DevSts::Credential& credential = TrustedCredential();
  return DevSts::SignXml(text.ToXml(), credential.privateKeyPem, credential.certificatePem);
}

TEST(CreateSamlTokenTest, VerifiesEveryReferenceEvenIfOneCoversTheToken) {
  const std::string xml = TwiceReferencedXml();
  const auto resolver = TrustedResolver();
  EXPECT_EQ(CreateSamlToken(xml, resolver.get())->Subject().name, "alice");
  const auto inside = ParseXml("<wrapper>" + xml + "</wrapper>");
  ElementNode* assertion = FindElement(inside->RootElement(), "Assertion");
  EXPECT_EQ(CreateSamlTokenFromDom(assertion)->Subject().name, "alice");
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>(
                [&] { CreateSamlTokenFromDom(assertion, resolver.get()); }),
            kTampered);
}

TEST(CreateSamlTokenTest, ChecksOnlyTheSignaturesFormWithoutAResolver) {
  const std::string xml = TamperedXml();
  EXPECT_EQ(CreateSamlToken(xml)->Subject().name, "admin");
  EXPECT_EQ(CreateSamlToken(xml, 600)->Subject().name, "admin");
  EXPECT_EQ(CreateSamlToken(xml, nullptr)->Subject().name, "admin");
  EXPECT_EQ(CreateSamlTokenFromDom(ParseXml(xml)->RootElement())->Subject().name, "admin");
  EXPECT_EQ(CreateSamlToken(AssertionText().ToXml())->Subject().name, "alice");
}

TEST(CreateSamlTokenTest, RefusesATamperedTokenThroughEveryResolver) {
  const std::string xml = TamperedXml();
  const auto resolver = TrustedResolver();
  const auto document = ParseXml(xml);
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>([&] { CreateSamlToken(xml, resolver.get()); }),
            kTampered);
  EXPECT_EQ(
      ThrownMessage<InvalidSignatureException>([&] { CreateSamlToken(xml, resolver.get(), 600); }),
      kTampered);
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>(
                [&] { CreateSamlToken(xml, [&](const SamlToken*) { return resolver; }); }),
            kTampered);
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>(
                [&] { CreateSamlTokenFromDom(document->RootElement(), resolver.get()); }),
            kTampered);
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>(
                [&] { CreateSamlTokenFromDom(document->RootElement(), resolver.get(), 600); }),
            kTampered);
}

TEST(CreateSamlTokenTest, RefusesAnAlteredSignatureValueOnlyWithAResolver) {
  std::string xml = SignedXml();
  const std::size_t value = xml.find("SignatureValue>") + 20;
  xml[value] = xml[value] == 'A' ? 'B' : 'A';
  EXPECT_EQ(CreateSamlToken(xml)->Subject().name, "alice");
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>(
                [&] { CreateSamlToken(xml, TrustedResolver().get()); }),
            kTampered);
}

TEST(CreateSamlTokenTest, RefusesAStrangersSignature) {
  const std::string xml = AssertionText().ToSignedXml(StrangerCredential());
  EXPECT_EQ(CreateSamlToken(xml)->Subject().name, "alice");
  const std::string message = ThrownMessage<InvalidSignatureException>(
      [&] { CreateSamlToken(xml, TrustedResolver().get()); });
  EXPECT_EQ(message.rfind("Signature verification error. ", 0), 0U) << message;
}

TEST(CreateSamlTokenTest, ReadsTheWholeTokenBeforeItChecksValidity) {
  AssertionText text;
  text.attributes = Replaced(text.attributes, "2.0", "1.1");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { CreateSamlToken(text.ToXml()); }),
            "Invalid token version");
  AssertionText uncovered = text;
  uncovered.signature = MadeUpSignature("#other");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { CreateSamlToken(uncovered.ToXml()); }),
            "Token's signature must cover the entire token");
  text.tail = "<x/>";
  EXPECT_EQ(ThrownMessage<ParseException>([&] { CreateSamlToken(text.ToXml()); }),
            "Unexpected elements under Assertion");
}

TEST(CreateSamlTokenTest, RefusesAnEmptyIdThatItsReferenceCovers) {
  AssertionText text;
  text.attributes = Replaced(text.attributes, "ID=\"_a1\"", "ID=\"\"");
  text.signature = MadeUpSignature("#");
  for (const auto& resolver : {Ref<const KeyInfoResolver>(), TrustedResolver()}) {
    EXPECT_EQ(ThrownMessage<ParseException>([&] { CreateSamlToken(text.ToXml(), resolver.get()); }),
              "Invalid token ID");
  }
}

TEST(CreateSamlTokenTest, ChecksValidityBeforeTheSignature) {
  const auto now = Tarnik::System::GetUtcDateTime();
  const auto longAgo = Tarnik::System::DateTimeFromUtc(now.GetUtcTime() - 7200L * 1'000'000, false);
  const std::string xml = Replaced(SignedXml(AssertionText(longAgo)), "alice@", "admin@");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { CreateSamlToken(xml, TrustedResolver().get()); }),
            "The token has expired at: " + TimeText(longAgo, 3600));
}

AssertionText TextThatEnds(long secondsAgo) {
  const auto now = Tarnik::System::GetUtcDateTime();
  return AssertionText(
      Tarnik::System::DateTimeFromUtc(now.GetUtcTime() - (3600 + secondsAgo) * 1'000'000, false));
}

TEST(CreateSamlTokenTest, ToleratesTenMinutesByDefault) {
  const std::string nineMinutes = TextThatEnds(540).ToXml();
  const std::string elevenMinutes = TextThatEnds(660).ToXml();
  EXPECT_NO_THROW(CreateSamlToken(nineMinutes));
  EXPECT_NO_THROW(CreateSamlTokenFromDom(ParseXml(nineMinutes)->RootElement()));
  EXPECT_THROW(CreateSamlToken(elevenMinutes), ParseException);
  EXPECT_THROW(CreateSamlTokenFromDom(ParseXml(elevenMinutes)->RootElement()), ParseException);
  EXPECT_THROW(CreateSamlToken(nineMinutes, 0L), ParseException);
  EXPECT_NO_THROW(CreateSamlToken(elevenMinutes, 720));
  EXPECT_NO_THROW(CreateSamlTokenFromDom(ParseXml(elevenMinutes)->RootElement(), 720));
}

TEST(CreateSamlTokenTest, ToleratesAStartTenMinutesAhead) {
  const auto startsIn = [](long seconds) {
    const auto now = Tarnik::System::GetUtcDateTime();
    return AssertionText(
        Tarnik::System::DateTimeFromUtc(now.GetUtcTime() + (60 + seconds) * 1'000'000, false));
  };
  EXPECT_NO_THROW(CreateSamlToken(startsIn(300).ToXml()));
  const auto text = startsIn(660);
  const std::string message = ThrownMessage<ParseException>([&] { CreateSamlToken(text.ToXml()); });
  EXPECT_EQ(message.rfind("Token start date is in the future: ", 0), 0U) << message;
  EXPECT_NO_THROW(CreateSamlToken(text.ToXml(), 720));
}

TEST(CreateSamlTokenTest, RemembersItsTolerance) {
  const std::string xml = SignedXml();
  const auto resolver = TrustedResolver();
  const auto seconds = [](const std::shared_ptr<const SamlToken>& token) {
    return (token->ExpirationTimeWithTolerance().GetUtcTime() -
            token->ExpirationTime().GetUtcTime()) /
           1'000'000;
  };
  EXPECT_EQ(seconds(CreateSamlToken(xml)), 600);
  EXPECT_EQ(seconds(CreateSamlToken(xml, 5)), 5);
  EXPECT_EQ(seconds(CreateSamlToken(xml, resolver.get())), 600);
  EXPECT_EQ(seconds(CreateSamlToken(xml, resolver.get(), 0)), 0);
  EXPECT_EQ(seconds(CreateSamlToken(xml, [&](const SamlToken*) { return resolver; })), 600);
  const auto document = ParseXml(xml);
  EXPECT_EQ(seconds(CreateSamlTokenFromDom(document->RootElement())), 600);
  EXPECT_EQ(seconds(CreateSamlTokenFromDom(document->RootElement(), 5)), 5);
  EXPECT_EQ(seconds(CreateSamlTokenFromDom(document->RootElement(), resolver.get())), 600);
  EXPECT_EQ(seconds(CreateSamlTokenFromDom(document->RootElement(), resolver.get(), 7)), 7);
}

TEST(CreateSamlTokenTest, KeepsTheTextAsGiven) {
  const std::string xml =
      "<?xml version='1.0' encoding='UTF-8'?>\r\n<!-- token -->\r\n" + SignedXml() + "\r\n";
  EXPECT_EQ(CreateSamlToken(xml, TrustedResolver().get())->Xml(), xml);
}

TEST(CreateSamlTokenFromDomTest, KeepsTheElementsCanonicalText) {
  const std::string xml = SignedXml();
  const auto document =
      ParseXml("<wrapper xmlns:unused='urn:unused'>" +
               Replaced(xml, "<saml2:Issuer ", "<!--dropped--><saml2:Issuer ") + "</wrapper>");
  const auto resolver = TrustedResolver();
  ElementNode* assertion = FindElement(document->RootElement(), "Assertion");
  const auto token = CreateSamlTokenFromDom(assertion, resolver.get());
  EXPECT_EQ(token->Xml(), DevSts::Canonicalize(
                              "<wrapper xmlns:unused='urn:unused'>" + xml + "</wrapper>",
                              "//*[local-name()='Assertion']", DevSts::CanonicalMode::Inclusive));
  EXPECT_EQ(CreateSamlToken(token->Xml(), resolver.get())->Xml(), token->Xml());
}

TEST(CreateSamlTokenTest, PassesThePlatformsFaultOfATextThatIsNotXml) {
  for (const char* xml : {"", "not XML", "<a>", "<a/><b/>", "<saml2:Assertion/>"}) {
    EXPECT_THROW(CreateSamlToken(xml), XMLParseException) << xml;
  }
}

TEST(CreateSamlTokenFromDomTest, PassesThePlatformsFaultOfAnElementWithoutCanonicalForm) {
  const auto document = ParseXml("<w xmlns:r=\"relative\">" + AssertionText().ToXml() + "</w>");
  EXPECT_THROW(CreateSamlTokenFromDom(FindElement(document->RootElement(), "Assertion")),
               Tarnik::Xml::Security::XmlSecurityException);
}

TEST(CreateSamlTokenFromDomTest, RefusesNullAndOtherElements) {
  EXPECT_EQ(ThrownMessage<ParseException>([] { CreateSamlTokenFromDom(nullptr); }),
            "Expected element 'Assertion' not found.");
  EXPECT_EQ(ThrownMessage<ParseException>(
                [] { CreateSamlTokenFromDom(ParseXml("<Response/>")->RootElement()); }),
            "Expected element 'Assertion' not found.");
}

TEST(CreateSamlTokenWithResolverSourceTest, ShowsTheTokenThatItReturns) {
  const SamlToken* shown = nullptr;
  std::string issuer;
  const auto token = CreateSamlToken(SignedXml(), [&](const SamlToken* unverified) {
    shown = unverified;
    issuer = unverified->Issuer();
    return TrustedResolver();
  });
  EXPECT_EQ(token.get(), shown);
  EXPECT_EQ(issuer, "https://sts.example.com/STS");
}

TEST(CreateSamlTokenWithResolverSourceTest, IsNotCalledForAnUnreadableToken) {
  bool asked = false;
  const auto source = [&](const SamlToken*) {
    asked = true;
    return TrustedResolver();
  };
  EXPECT_THROW(CreateSamlToken(TextThatEnds(3600).ToXml(), source), ParseException);
  EXPECT_FALSE(asked);
}

TEST(CreateSamlTokenWithResolverSourceTest, RefusesANullResolver) {
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>([] {
              CreateSamlToken(SignedXml(),
                              [](const SamlToken*) { return Ref<const KeyInfoResolver>(); });
            }),
            "Signature verification error. There is no key info resolver for the token.");
}

TEST(CreateSamlTokenWithResolverSourceTest, RefusesAnEmptySource) {
  EXPECT_EQ(ThrownMessage<Tarnik::InvalidArgumentException>(
                [] { CreateSamlToken("not XML", KeyInfoResolverSource()); }),
            "The source of key info resolvers must not be empty.");
}

TEST(CreateSamlTokenWithResolverSourceTest, PassesWhatItThrows) {
  EXPECT_EQ(ThrownMessage<Tarnik::InvalidStateException>([] {
              CreateSamlToken(SignedXml(), [](const SamlToken*) -> Ref<const KeyInfoResolver> {
                throw Tarnik::InvalidStateException("no keys today");
              });
            }),
            "no keys today");
}

TEST(CreateSamlTokenTest, RefusesATokenCutAtEveryByte) {
  const std::string xml = SignedXml();
  for (std::size_t length = 0; length < xml.size(); ++length) {
    ASSERT_THROW(CreateSamlToken(xml.substr(0, length)), XMLParseException) << length;
  }
}

TEST(CreateSamlTokenTest, RefusesDocumentTypes) {
  const std::string xml = SignedXml();
  for (const std::string type :
       {"<!DOCTYPE a>", "<!DOCTYPE a [<!ENTITY e \"x\">]>", "<!DOCTYPE a SYSTEM \"file:///etc\">",
        "<!DOCTYPE a PUBLIC \"p\" \"http://127.0.0.1/\">"}) {
    EXPECT_THROW(CreateSamlToken(type + xml), XMLParseException) << type;
  }
}

TEST(CreateSamlTokenTest, ReadsOnlyUtf8) {
  const std::string xml = SignedXml();
  const auto resolver = TrustedResolver();
  EXPECT_EQ(CreateSamlToken("\xEF\xBB\xBF" + xml, resolver.get())->Subject().name, "alice");
  for (const char* encoding : {"UTF-16", "UTF-7", "ISO-8859-1"}) {
    EXPECT_THROW(
        CreateSamlToken(std::string("<?xml version='1.0' encoding='") + encoding + "'?>" + xml),
        XMLParseException);
  }
  for (const std::string& bytes : {std::string("\xC0\x80"), std::string("\xED\xA0\x80"),
                                   std::string(1, '\0'), std::string("\xEF\xBF\xBE")}) {
    EXPECT_THROW(CreateSamlToken(Replaced(xml, "Archer", bytes)), XMLParseException);
  }
}

TEST(CreateSamlTokenTest, RefusesDeepNestingWithoutRecursion) {
  AssertionText text;
  std::string deep;
  for (int i = 0; i < 100'000; ++i) {
    deep += "<x>";
  }
  text.tail = deep;
  EXPECT_THROW(CreateSamlToken(text.ToXml()), XMLParseException);
}

TEST(CreateSamlTokenTest, RefusesTwoAttributesWithTheSameExpandedName) {
  AssertionText text;
  text.attributes += " Version=\"2.0\"";
  EXPECT_THROW(CreateSamlToken(text.ToXml()), XMLParseException);
  AssertionText prefixes;
  prefixes.attributes += " xmlns:y=\"urn:y\" xmlns:z=\"urn:y\" y:a=\"\" z:a=\"\"";
  EXPECT_THROW(CreateSamlToken(prefixes.ToXml()), XMLParseException);
}

TEST(CreateSamlTokenTest, MakesTokensOnManyThreads) {
  const std::string xml = SignedXml();
  const auto resolver = TrustedResolver();
  const auto shared = CreateSamlToken(xml, resolver.get());
  std::vector<std::thread> threads;
  std::vector<int> accepted(4, 0);
  for (int& count : accepted) {
    threads.emplace_back([&] {
      for (int i = 0; i < 20; ++i) {
        count += CreateSamlToken(xml, resolver.get())->Subject() == shared->Subject() ? 1 : 0;
        count += shared->GetSignature()->Verify(resolver.get()) ? 1 : 0;
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(accepted, (std::vector<int>{40, 40, 40, 40}));
}

}  // namespace
}  // namespace SsoClient::Testing
