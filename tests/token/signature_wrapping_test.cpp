#include <ssoclient/saml_token.h>

#include "support/assertion_text.h"
#include "support/parsed_xml.h"
#include "token/element_rules.h"

// Forged assertions beside a signed original, in every arrangement: whatever a resolver lets
// through must be the signed original itself.
namespace SsoClient {
namespace {

using Tarnik::Xml::ElementNode;
using TestSupport::AssertionText;
using TestSupport::InsertedBehind;
using TestSupport::ParseXml;
using TestSupport::Replaced;

enum class ForgedId { kSame, kNew, kNone };
enum class ForgedSignature { kOriginal, kStranger, kUnsigned, kMadeUp };
enum class Place {
  kBefore,
  kAfter,
  kParentInObject,
  kParentInKeyInfo,
  kParentInAdvice,
  kParentInAttributeValue,
  kParentAtEnd,
  kChildOfOriginal,
  kSoapHeader,
};

std::string SignatureOf(const std::string& assertion) {
  const std::size_t begin = assertion.find("<ds:Signature");
  if (begin == std::string::npos) {
    const std::size_t plain = assertion.find("<Signature");
    const std::string end = "</Signature>";
    return assertion.substr(plain, assertion.find(end) + end.size() - plain);
  }
  const std::string end = "</ds:Signature>";
  return assertion.substr(begin, assertion.find(end) + end.size() - begin);
}

AssertionText ForgedText(ForgedId id) {
  AssertionText text;
  text.subject = Replaced(text.subject, "alice@", "admin@");
  if (id == ForgedId::kNew) {
    text.attributes = Replaced(text.attributes, "_a1", "_b2");
  }
  if (id == ForgedId::kNone) {
    text.attributes = Replaced(text.attributes, "ID=\"_a1\" ", "");
  }
  return text;
}

std::string ForgedXml(ForgedId id, ForgedSignature signature, const std::string& original) {
  AssertionText text = ForgedText(id);
  switch (signature) {
    case ForgedSignature::kOriginal:
      text.signature = SignatureOf(original);
      return text.ToXml();
    case ForgedSignature::kStranger:
      return text.ToSignedXml(TestSupport::StrangerCredential());
    case ForgedSignature::kUnsigned:
      text.signature.clear();
      return text.ToXml();
    case ForgedSignature::kMadeUp:
      text.signature = TestSupport::MadeUpSignature(id == ForgedId::kNew ? "#_b2" : "#_a1");
      return text.ToXml();
  }
  return "";
}

// Puts `content` behind the last start or end tag of this local name, if there is one.
std::string BehindLast(const std::string& xml, const std::string& tag, const std::string& content) {
  const std::size_t at = xml.rfind(tag);
  if (at == std::string::npos) {
    return "";
  }
  return xml.substr(0, at) + content + xml.substr(at);
}

std::string Arrange(Place place, const std::string& forged, const std::string& original) {
  switch (place) {
    case Place::kBefore:
      return "<r>" + forged + original + "</r>";
    case Place::kAfter:
      return "<r>" + original + forged + "</r>";
    case Place::kParentInObject:
      return BehindLast(forged, "</ds:Signature>", "<ds:Object>" + original + "</ds:Object>");
    case Place::kParentInKeyInfo:
      return BehindLast(forged, "</ds:Signature>", "<ds:KeyInfo>" + original + "</ds:KeyInfo>");
    case Place::kParentInAdvice:
      return BehindLast(forged, "</saml2:Advice>", original);
    case Place::kParentInAttributeValue:
      return BehindLast(forged, "</saml2:AttributeValue>", original);
    case Place::kParentAtEnd:
      return BehindLast(forged, "</saml2:Assertion>", original);
    case Place::kChildOfOriginal:
      return BehindLast(original, "</saml2:Advice>", forged);
    case Place::kSoapHeader:
      return "<e:Envelope xmlns:e=\"http://schemas.xmlsoap.org/soap/envelope/\"><e:Header>" +
             original + "</e:Header><e:Body>" + forged + "</e:Body></e:Envelope>";
  }
  return "";
}

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

// "" if refused, else the name of the accepted subject.
template <class Create>
std::string AcceptedSubject(Create&& create) {
  try {
    return create()->Subject().name;
  } catch (const Tarnik::Exception&) {
    return "";
  }
}

using Attack = std::tuple<Place, ForgedId, ForgedSignature>;

class SignatureWrapping : public testing::TestWithParam<Attack> {};

TEST_P(SignatureWrapping, NeverYieldsTheForgedAssertion) {
  const auto& [place, id, signature] = GetParam();
  const std::string original = AssertionText().ToSignedXml(TestSupport::TrustedCredential());
  const std::string xml = Arrange(place, ForgedXml(id, signature, original), original);
  if (xml.empty()) {
    return;  // an unsigned forgery has no signature to hide the original in
  }
  const auto resolver = TestSupport::TrustedResolver();
  EXPECT_EQ(AcceptedSubject([&] { return CreateSamlToken(xml, resolver.get()); }), "");
  const auto document = ParseXml(xml);
  std::vector<ElementNode*> assertions;
  CollectAssertions(document->RootElement(), assertions);
  ASSERT_EQ(assertions.size(), 2U);
  for (ElementNode* assertion : assertions) {
    const std::string accepted =
        AcceptedSubject([&] { return CreateSamlTokenFromDom(assertion, resolver.get()); });
    if (HoldsForgedSubject(assertion)) {
      EXPECT_EQ(accepted, "");
    } else {
      EXPECT_NE(accepted, "admin");
    }
  }
}

INSTANTIATE_TEST_SUITE_P(
    Arrangements, SignatureWrapping,
    testing::Combine(testing::Values(Place::kBefore, Place::kAfter, Place::kParentInObject,
                                     Place::kParentInKeyInfo, Place::kParentInAdvice,
                                     Place::kParentInAttributeValue, Place::kParentAtEnd,
                                     Place::kChildOfOriginal, Place::kSoapHeader),
                     testing::Values(ForgedId::kSame, ForgedId::kNew, ForgedId::kNone),
                     testing::Values(ForgedSignature::kOriginal, ForgedSignature::kStranger,
                                     ForgedSignature::kUnsigned, ForgedSignature::kMadeUp)));

// The same forgeries read without a resolver where only the signature gives them away, so it is the
// signature that the tests above see refused.
TEST(SignatureWrappingTwin, ReadsForgeriesWhenNothingIsVerified) {
  const std::string original = AssertionText().ToSignedXml(TestSupport::TrustedCredential());
  for (const ForgedSignature signature :
       {ForgedSignature::kOriginal, ForgedSignature::kStranger, ForgedSignature::kMadeUp}) {
    for (const Place place : {Place::kBefore, Place::kAfter, Place::kSoapHeader}) {
      const auto document =
          ParseXml(Arrange(place, ForgedXml(ForgedId::kSame, signature, original), original));
      std::vector<ElementNode*> assertions;
      CollectAssertions(document->RootElement(), assertions);
      for (ElementNode* assertion : assertions) {
        EXPECT_EQ(AcceptedSubject([&] { return CreateSamlTokenFromDom(assertion); }),
                  HoldsForgedSubject(assertion) ? "admin" : "alice");
      }
    }
  }
}

// An original whose id is its own verifies in whatever document it stands.
TEST(SignatureWrappingTwin, AcceptsTheOriginalBesideAnotherAssertion) {
  const std::string original = AssertionText().ToSignedXml(TestSupport::TrustedCredential());
  const auto resolver = TestSupport::TrustedResolver();
  for (const Place place : {Place::kBefore, Place::kAfter, Place::kSoapHeader}) {
    const auto document = ParseXml(
        Arrange(place, ForgedXml(ForgedId::kNew, ForgedSignature::kStranger, original), original));
    std::vector<ElementNode*> assertions;
    CollectAssertions(document->RootElement(), assertions);
    for (ElementNode* assertion : assertions) {
      EXPECT_EQ(AcceptedSubject([&] { return CreateSamlTokenFromDom(assertion, resolver.get()); }),
                HoldsForgedSubject(assertion) ? "" : "alice");
    }
  }
}

// Ids under other names that hold the same value.
TEST(SignatureWrapping, RefusesASecondElementOfTheSameId) {
  const std::string original = AssertionText().ToSignedXml(TestSupport::TrustedCredential());
  const auto resolver = TestSupport::TrustedResolver();
  for (const char* twin : {"<x ID=\"_a1\"/>", "<x Id=\"_a1\"/>", "<x xml:id=\"_a1\"/>"}) {
    const auto document = ParseXml("<r>" + original + twin + "</r>");
    ElementNode* assertion = TestSupport::FindElement(document->RootElement(), "Assertion");
    EXPECT_THROW(CreateSamlTokenFromDom(assertion, resolver.get()), InvalidSignatureException)
        << twin;
  }
}

TEST(SignatureWrapping, RefusesSignaturesOutOfTheirPlace) {
  const auto resolver = TestSupport::TrustedResolver();
  const std::string original = AssertionText().ToSignedXml(TestSupport::TrustedCredential());
  const std::string signature = SignatureOf(original);
  const std::string bare = Replaced(original, signature, "");
  const std::string variants[] = {bare, InsertedBehind(bare, "</saml2:Subject>", signature),
                                  BehindLast(bare, "</saml2:Assertion>", signature),
                                  InsertedBehind(original, signature, signature),
                                  Replaced(bare, "<saml2:Subject>", "<saml2:Subject>" + signature)};
  EXPECT_EQ(CreateSamlToken(original, resolver.get())->Subject().name, "alice");
  for (const std::string& variant : variants) {
    EXPECT_THROW(CreateSamlToken(variant, resolver.get()), ParseException);
    EXPECT_THROW(CreateSamlToken(variant), ParseException);
  }
}

}  // namespace
}  // namespace SsoClient
