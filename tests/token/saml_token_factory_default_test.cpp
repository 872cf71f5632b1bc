#include "token/saml_token_factory_default.h"

#include <memory>
#include <string>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/saml_token_factory.h>
#include <tarnik/xml/element_node.h>

#include "support/assertion_text.h"
#include "support/parse_xml.h"
#include "support/thrown_message.h"
#include "support/vtable_slot.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Xml::ElementNode;
using Token = std::shared_ptr<const SamlToken>;

std::string SignedXml() {
  return AssertionText().ToSignedXml(TrustedCredential());
}

long ToleranceOf(const Token& token) {
  return (token->ExpirationTimeWithTolerance().GetUtcTime() -
          token->ExpirationTime().GetUtcTime()) /
         1'000'000;
}

TEST(SamlTokenFactoryDefaultTest, CreatesVerifiedTokens) {
  const auto factory = CreateSamlTokenFactory(TrustedResolver().get());
  const std::string xml = SignedXml();
  const auto document = ParseXml(xml);
  EXPECT_EQ(ToleranceOf(factory->CreateToken(xml)), 600);
  EXPECT_EQ(ToleranceOf(factory->CreateToken(xml, 5)), 5);
  EXPECT_EQ(ToleranceOf(factory->CreateToken(document->RootElement())), 600);
  EXPECT_EQ(ToleranceOf(factory->CreateToken(document->RootElement(), 5)), 5);
}

TEST(SamlTokenFactoryDefaultTest, RefusesABadSignatureThroughEveryOperation) {
  const auto factory = CreateSamlTokenFactory(TrustedResolver().get());
  const std::string xml = Replaced(SignedXml(), "alice@", "admin@");
  const auto document = ParseXml(xml);
  const std::string expected = "Failed to verify signature: token might have been tampered with.";
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>([&] { factory->CreateToken(xml); }), expected);
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>([&] { factory->CreateToken(xml, 5); }),
            expected);
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>(
                [&] { factory->CreateToken(document->RootElement()); }),
            expected);
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>(
                [&] { factory->CreateToken(document->RootElement(), 5); }),
            expected);
}

TEST(SamlTokenFactoryDefaultTest, VerifiesNothingWithoutAResolver) {
  const std::string xml = Replaced(SignedXml(), "alice@", "admin@");
  EXPECT_EQ(CreateSamlTokenFactory(nullptr)->CreateToken(xml)->Subject().name, "admin");
}

TEST(SamlTokenFactoryDefaultTest, KeepsItsResolverAlive) {
  auto resolver = TrustedResolver();
  const auto factory = CreateSamlTokenFactory(resolver.get());
  EXPECT_EQ(resolver->RefCount(), 2);
  resolver.reset();
  EXPECT_EQ(factory->CreateToken(SignedXml())->Subject().name, "alice");
}

// Records the tolerances that it is called with.
class RecordingFactory final : public SamlTokenFactoryDefault {
 public:
  RecordingFactory() : SamlTokenFactoryDefault(nullptr) {}

  using SamlTokenFactoryDefault::CreateToken;
  Token CreateToken(const std::string&, long clockToleranceSec) const override {
    textTolerance = clockToleranceSec;
    return nullptr;
  }
  Token CreateToken(ElementNode*, long clockToleranceSec) const override {
    elementTolerance = clockToleranceSec;
    return nullptr;
  }

  mutable long textTolerance = 0;
  mutable long elementTolerance = 0;
};

TEST(SamlTokenFactoryDefaultTest, CallsASubclassWithTheDefaultTolerance) {
  const RecordingFactory factory;
  const SamlTokenFactory& face = factory;
  EXPECT_EQ(face.CreateToken("text"), nullptr);
  EXPECT_EQ(factory.textTolerance, 600);
  EXPECT_EQ(face.CreateToken(nullptr), nullptr);
  EXPECT_EQ(factory.elementTolerance, 600);
}

TEST(SamlTokenFactoryTest, KeepsItsSlotOrder) {
  const auto factory = CreateSamlTokenFactory(TrustedResolver().get());
  const SamlTokenFactory* face = factory.get();
  const std::string xml = SignedXml();
  const auto document = ParseXml(xml);
  ElementNode* root = document->RootElement();
  EXPECT_EQ(ToleranceOf(
                VtableSlot<Token(const SamlTokenFactory*, const std::string&)>(face, 0)(face, xml)),
            600);
  EXPECT_EQ(ToleranceOf(VtableSlot<Token(const SamlTokenFactory*, const std::string&, long)>(
                face, 1)(face, xml, 5)),
            5);
  EXPECT_EQ(
      ToleranceOf(VtableSlot<Token(const SamlTokenFactory*, ElementNode*)>(face, 2)(face, root)),
      600);
  EXPECT_EQ(ToleranceOf(VtableSlot<Token(const SamlTokenFactory*, ElementNode*, long)>(face, 3)(
                face, root, 5)),
            5);
}

}  // namespace
}  // namespace SsoClient::Testing
