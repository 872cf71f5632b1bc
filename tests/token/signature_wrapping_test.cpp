#include <string>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>
#include <tarnik/xml/element_node.h>

#include "support/assertion_text.h"
#include "support/forgeries.h"
#include "support/parse_xml.h"
#include "support/thrown_message.h"
#include "token/strict_rules.h"

// Forged assertions together with a signed original, in every arrangement: only the signed original
// itself may be accepted.
namespace SsoClient::Testing {
namespace {

using Tarnik::Xml::ElementNode;

void CollectAssertions(ElementNode* element, std::vector<ElementNode*>& found) {
  if (element->LocalName() == "Assertion") {
    found.push_back(element);
  }
  for (Tarnik::Xml::Node* child = element->FirstChild(); child != nullptr;
       child = child->NextSibling()) {
    if (ElementNode* inner = AsElement(child)) {
      CollectAssertions(inner, found);
    }
  }
}

bool HoldsForgedSubject(const ElementNode* assertion) {
  const ElementNode* subject = assertion->FirstChildElement("Subject");
  return ReadTextContent(*subject->FirstChildElement("NameID")) == "admin@example.com";
}

// The name of the accepted subject; "" if refused.
template <class Create>
std::string AcceptedSubject(Create&& create) {
  try {
    return create()->Subject().name;
  } catch (const Tarnik::Exception&) {
    return "";
  }
}

using Attack = std::tuple<Place, ForgedId, ForgedSignature>;

class SignatureWrappingTest : public testing::TestWithParam<Attack> {};

TEST_P(SignatureWrappingTest, NeverReturnsTheForgedAssertion) {
  const auto& [place, id, signature] = GetParam();
  const std::string original = OriginalAssertion();
  const std::string xml = Arranged(place, ForgedAssertion(id, signature, original), original);
  if (xml.empty()) {
    EXPECT_TRUE(signature == ForgedSignature::kUnsigned);
    return;
  }
  const auto resolver = TrustedResolver();
  EXPECT_EQ(AcceptedSubject([&] { return CreateSamlToken(xml, resolver.get()); }), "");
  const auto document = ParseXml(xml);
  std::vector<ElementNode*> assertions;
  CollectAssertions(document->RootElement(), assertions);
  ASSERT_EQ(assertions.size(), 2U);
  for (ElementNode* assertion : assertions) {
    const std::string accepted =
        AcceptedSubject([&] { return CreateSamlTokenFromDom(assertion, resolver.get()); });
    EXPECT_TRUE(accepted.empty() || accepted == "alice") << accepted;
    if (HoldsForgedSubject(assertion)) {
      EXPECT_EQ(accepted, "");
    }
  }
}

INSTANTIATE_TEST_SUITE_P(Arrangements, SignatureWrappingTest,
                         testing::Combine(testing::ValuesIn(AllPlaces()),
                                          testing::ValuesIn(AllForgedIds()),
                                          testing::ValuesIn(AllForgedSignatures())));

// Without a resolver, forgeries that only their signature reveals are accepted. So in the tests
// above they are refused because of the signature.
TEST(SignatureWrappingControlTest, ReadsForgeriesWhenNothingIsVerified) {
  const std::string original = OriginalAssertion();
  for (const ForgedSignature signature :
       {ForgedSignature::kOriginal, ForgedSignature::kStranger, ForgedSignature::kMadeUp}) {
    for (const Place place : {Place::kBefore, Place::kAfter, Place::kOriginalInSoapHeader}) {
      const auto document = ParseXml(
          Arranged(place, ForgedAssertion(ForgedId::kSame, signature, original), original));
      std::vector<ElementNode*> assertions;
      CollectAssertions(document->RootElement(), assertions);
      for (ElementNode* assertion : assertions) {
        EXPECT_EQ(AcceptedSubject([&] { return CreateSamlTokenFromDom(assertion); }),
                  HoldsForgedSubject(assertion) ? "admin" : "alice");
      }
    }
  }
}

// An original with a unique id verifies in every document.
TEST(SignatureWrappingControlTest, AcceptsTheOriginalNextToAnotherAssertion) {
  const std::string original = OriginalAssertion();
  const auto resolver = TrustedResolver();
  for (const Place place : {Place::kBefore, Place::kAfter, Place::kOriginalInSoapHeader}) {
    const auto document = ParseXml(Arranged(
        place, ForgedAssertion(ForgedId::kNew, ForgedSignature::kStranger, original), original));
    std::vector<ElementNode*> assertions;
    CollectAssertions(document->RootElement(), assertions);
    for (ElementNode* assertion : assertions) {
      EXPECT_EQ(AcceptedSubject([&] { return CreateSamlTokenFromDom(assertion, resolver.get()); }),
                HoldsForgedSubject(assertion) ? "" : "alice");
    }
  }
}

// Id attributes of other names with the same value.
TEST(SignatureWrappingTest, RefusesASecondElementWithTheSameId) {
  const std::string original = OriginalAssertion();
  const auto resolver = TrustedResolver();
  for (const char* sameId : {"<x ID=\"_a1\"/>", "<x Id=\"_a1\"/>", "<x xml:id=\"_a1\"/>"}) {
    const auto document = ParseXml("<r>" + original + sameId + "</r>");
    ElementNode* assertion = FindElement(document->RootElement(), "Assertion");
    EXPECT_THROW(CreateSamlTokenFromDom(assertion, resolver.get()), InvalidSignatureException)
        << sameId;
  }
}

// An assertion is not accepted in a place that the signature's digest does not cover.
TEST(SignatureWrappingTest, RefusesAnAssertionInTheKeyInfoOfTheOriginal) {
  const std::string original = OriginalAssertion();
  const auto resolver = TrustedResolver();
  const std::string forged = ForgedAssertion(ForgedId::kNew, ForgedSignature::kStranger, original);
  for (const Place place : {Place::kChildInKeyInfo, Place::kChildInX509Data}) {
    EXPECT_EQ(ThrownMessage<ParseException>(
                  [&] { CreateSamlToken(Arranged(place, forged, original), resolver.get()); }),
              "Token's signature must not hold SAML elements");
    // Control: an element of another namespace in the same place does not change the verdict.
    EXPECT_EQ(AcceptedSubject([&] {
                return CreateSamlToken(Arranged(place, "<x xmlns=\"urn:x\"/>", original),
                                       resolver.get());
              }),
              "alice");
  }
}

TEST(SignatureWrappingTest, RefusesSignaturesOutOfTheirPlace) {
  const auto resolver = TrustedResolver();
  const std::string original = OriginalAssertion();
  const std::string signature = SignatureOf(original);
  const std::string bare = Replaced(original, signature, "");
  const std::string variants[] = {
      bare, InsertedAfter(bare, "</saml2:Subject>", signature),
      Replaced(bare, "</saml2:Assertion>", signature + "</saml2:Assertion>"),
      InsertedAfter(original, signature, signature),
      Replaced(bare, "<saml2:Subject>", "<saml2:Subject>" + signature)};
  EXPECT_EQ(CreateSamlToken(original, resolver.get())->Subject().name, "alice");
  for (const std::string& variant : variants) {
    EXPECT_THROW(CreateSamlToken(variant, resolver.get()), ParseException);
    EXPECT_THROW(CreateSamlToken(variant), ParseException);
  }
}

}  // namespace
}  // namespace SsoClient::Testing
