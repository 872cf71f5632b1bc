#include "xml/security/reference_targets.h"

#include <cstddef>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>

#include "support/algorithm_uris.h"
#include "support/signed_documents.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;

constexpr const char* kAmbiguous =
    "refused: More than one element has the id '_a1' of a reference.";
constexpr const char* kMissing = "refused: No element has the id '_a1' of a reference.";

/// The signed assertion next to `other`, in an envelope that the signature does not cover.
std::string NextTo(const std::string& other, bool isAfter = true) {
  const std::string assertion = Signed();
  return "<e:Envelope xmlns:e=\"urn:e\">" + (isAfter ? assertion + other : other + assertion) +
         "</e:Envelope>";
}

TEST(ReferenceTargetsTest, IsTheOnlyElementWithTheId) {
  EXPECT_EQ(Verdict(NextTo("<x ID=\"_a2\" other=\"_a1\">_a1</x>")), "valid");
}

class SecondIdTest : public testing::TestWithParam<const char*> {};

TEST_P(SecondIdTest, IsRefusedOnAnotherElement) {
  const std::string attribute = GetParam();
  for (const bool isAfter : {true, false}) {
    EXPECT_EQ(Verdict(NextTo("<x " + attribute + "=\"_a1\"/>", isAfter)), kAmbiguous);
    EXPECT_EQ(Verdict(NextTo("<y><x " + attribute + "=\" _a1\n\"/></y>", isAfter)), kAmbiguous);
    EXPECT_EQ(Verdict(NextTo("<x " + attribute + "=\"_a1x\"/>", isAfter)), "valid");
  }
  EXPECT_EQ(Verdict("<x " + attribute + "=\"_a1\">" + Signed() + "</x>"), kAmbiguous);
}

INSTANTIATE_TEST_SUITE_P(Names, SecondIdTest,
                         testing::Values("ID", "Id", "id", "iD", "xml:id", "xmlns:p=\"urn:p\" p:ID",
                                         "xmlns:p=\"urn:p\" p:Id",
                                         "xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
                                         "oasis-200401-wss-wssecurity-utility-1.0.xsd\" wsu:Id",
                                         "xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
                                         "oasis-200401-wss-wssecurity-utility-1.0.xsd\" wsu:ID"));

TEST(ReferenceTargetsTest, RefusesAnIdInsideTheSignature) {
  EXPECT_EQ(Verdict(Replaced(Signed(), "<ds:KeyInfo", "<ds:KeyInfo Id=\"_a1\"")), kAmbiguous);
  EXPECT_EQ(Verdict(Replaced(Signed(), "<ds:KeyInfo", "<ds:KeyInfo Id=\"_a2\"")), "valid");
}

TEST(ReferenceTargetsTest, RefusesAnIdThatNoElementHas) {
  const std::string text = Signed();
  EXPECT_EQ(Verdict(Replaced(text, " ID=\"_a1\"", " ID=\"_a2\"")), kMissing);
  EXPECT_EQ(Verdict(Replaced(text, " ID=\"_a1\"", " ID=\"_a1 \"")), kMissing);
  EXPECT_EQ(Verdict(Replaced(text, " ID=\"_a1\"", " iD=\"_a1\"")), kMissing);
  EXPECT_EQ(Verdict(Replaced(text, " ID=\"_a1\"", " saml:ID=\"_a1\"")), kMissing);
  EXPECT_EQ(Verdict(Replaced(text, " ID=\"_a1\"", " IDs=\"_a1\"")), kMissing);
}

/// A template of a document whose signed element has its id in `attribute`.
std::string SignedWithId(const std::string& attribute) {
  SignatureTemplate signature;
  signature.uri = "#_b2";
  signature.transforms = Transforms({kExclusive});
  return "<Envelope>" + signature.Text() + "<Body " + attribute + "=\"_b2\">text</Body></Envelope>";
}

TEST(ReferenceTargetsTest, AreFoundByEveryIdAttribute) {
  for (const char* attribute : {"ID", "Id",
                                "xmlns:u=\"http://docs.oasis-open.org/wss/2004/01/"
                                "oasis-200401-wss-wssecurity-utility-1.0.xsd\" u:Id"}) {
    const std::string text = Signed({}, SignedWithId(attribute));
    EXPECT_EQ(Verdict(text), "valid") << attribute;
    EXPECT_EQ(Verdict(Replaced(text, "text", "tampered")), "invalid") << attribute;
  }
}

/// The same with made-up values, for attributes that the oracle does not know.
std::string MadeUpWithId(const std::string& attribute) {
  const std::string text =
      Replaced(SignedWithId(attribute), "<ds:DigestValue>", "<ds:DigestValue>AAAA");
  return Replaced(text, "<ds:SignatureValue>", "<ds:SignatureValue>AAAA");
}

TEST(ReferenceTargetsTest, AreFoundByIdsInLowerCase) {
  // The last one is one element with the same id twice.
  for (const char* attribute : {"ID", "id", "xml:id", "ID=\"_b2\" xml:id"}) {
    EXPECT_EQ(Verdict(MadeUpWithId(attribute)), "invalid") << attribute;
  }
}

TEST(ReferenceTargetsTest, AreNotFoundByPrefixedAttributesOfOtherNames) {
  const std::string wsu =
      "xmlns:u=\"http://docs.oasis-open.org/wss/2004/01/"
      "oasis-200401-wss-wssecurity-utility-1.0.xsd\" ";
  for (const std::string& attribute :
       {std::string("xmlns:u=\"urn:u\" u:Id"), std::string("xmlns:u=\"urn:u\" u:id"),
        std::string("xml:Id"), std::string("xml:ID"), wsu + "u:ID", wsu + "u:id"}) {
    EXPECT_EQ(Verdict(MadeUpWithId(attribute)),
              "refused: No element has the id '_b2' of a reference.")
        << attribute;
  }
}

class ReferenceUriTest : public testing::TestWithParam<const char*> {};

TEST_P(ReferenceUriTest, OfAnotherFormIsRefused) {
  SignatureTemplate signature;
  signature.uri = GetParam();
  const std::string verdict = Verdict(AssertionWithValues(signature));
  EXPECT_THAT(verdict, testing::StartsWith("refused: The reference '"));
  EXPECT_THAT(verdict, testing::EndsWith("' is not of the form '#id' within the document."));
}

INSTANTIATE_TEST_SUITE_P(Forms, ReferenceUriTest,
                         testing::Values("#", "##_a1", "# _a1", "#_a1 ", " #_a1", "_a1",
                                         "#xpointer(/)", "#xpointer(id('_a1'))", "#id('_a1')",
                                         "#element(/1)", "#_a1'", "#&quot;_a1&quot;", "#%5Fa1",
                                         "#1a", "#-a", "#a:b", "#\xC3\xA4", "file:///etc/passwd",
                                         "http://127.0.0.1:1/x", "document.xml#_a1", "?x", "cid:x",
                                         "#_a1#_a1", "#_a1&#10;"));

TEST(ReferenceTargetsTest, AcceptsTheSupportedForm) {
  SignatureTemplate signature;
  EXPECT_EQ(Verdict(AssertionWithValues(signature)), "invalid");
  signature.uri = "#_a1.b-C9";
  EXPECT_EQ(Verdict(AssertionWithValues(signature)),
            "refused: No element has the id '_a1.b-C9' of a reference.");
}

TEST(ReferenceTargetsTest, IsTheWholeDocumentForAnEmptyUri) {
  SignatureTemplate signature;
  signature.uri = "";
  const std::string text =
      Signed({}, "<?style sheet?><!-- c -->" + AssertionWith(signature.Text()) + "<?end?>");
  ASSERT_TRUE(DevSts::VerifyXml(text, Signer().certificatePem));
  EXPECT_EQ(Verdict(text), "valid");
  EXPECT_EQ(Verdict(Replaced(text, "<!-- c -->", "")), "valid");
  EXPECT_EQ(Verdict(Replaced(text, "<?end?>", "")), "invalid");
  EXPECT_EQ(Verdict(Replaced(text, "user@example", "root@example")), "invalid");
  const std::size_t root = text.find("<Assertion");
  const std::string assertion = text.substr(root, text.find("<?end") - root);
  EXPECT_EQ(Verdict("<Envelope>" + assertion + "</Envelope>"), "invalid");
}

TEST(ReferenceTargetsTest, IsTheWholeTreeOfAnElementWithoutADocument) {
  SignatureTemplate signature;
  signature.uri = "";
  const auto document = ParseXml(Signed({}, AssertionWith(signature.Text())));
  ElementNode* root = document->RootElement();
  ElementNode* element = FindElement(document.get(), "Signature");
  document->RemoveChild(root);
  const auto resolver = Trusting(Signer());
  EXPECT_TRUE(CreateSignatureFromDom(element)->Verify(resolver.get()));
  root->SetAttribute("more", "1");
  EXPECT_FALSE(CreateSignatureFromDom(element)->Verify(resolver.get()));
}

TEST(ReferenceTargetsTest, MustNotBeInsideTheSignature) {
  SignatureTemplate signature;
  signature.uri = "#_k";
  signature.keyInfo = "<ds:KeyInfo Id=\"_k\"><ds:KeyName>x</ds:KeyName></ds:KeyInfo>";
  EXPECT_EQ(Verdict(AssertionWithValues(signature)),
            "refused: The reference '#_k' points into the signature itself.");
  std::string text = AssertionWithValues(signature);
  text = Replaced(text, " Id=\"_k\"", "");
  text = Replaced(text, "<ds:Signature ", "<ds:Signature Id=\"_k\" ");
  EXPECT_EQ(Verdict(text), "refused: The reference '#_k' points into the signature itself.");
  signature.transforms = Transforms({kExclusive});
  EXPECT_EQ(Verdict(AssertionWithValues(signature)),
            "refused: The reference '#_k' points into the signature itself.");
}

TEST(ReferenceTargetsTest, NeedTheEnvelopedTransformAroundTheSignature) {
  SignatureTemplate signature;
  EXPECT_EQ(Verdict(Signed({}, AssertionWith(signature.Text()))), "valid");
  signature.transforms = Transforms({kExclusive});
  EXPECT_EQ(Verdict(AssertionWithValues(signature)),
            "refused: The reference '#_a1' encloses the signature without the "
            "enveloped-signature transform.");
  signature.uri = "";
  EXPECT_EQ(Verdict(AssertionWithValues(signature)),
            "refused: The reference '' encloses the signature without the enveloped-signature "
            "transform.");
}

TEST(ReferenceTargetsTest, MustNotHaveTheEnvelopedTransformElsewhere) {
  SignatureTemplate signature;
  signature.uri = "#_b2";
  std::string text = Replaced(SignedWithId("ID"), "<ds:Transforms>",
                              "<ds:Transforms><ds:Transform Algorithm=\"http://www.w3.org/2000/09/"
                              "xmldsig#enveloped-signature\"/>");
  text = Replaced(text, "<ds:DigestValue>", "<ds:DigestValue>AAAA");
  text = Replaced(text, "<ds:SignatureValue>", "<ds:SignatureValue>AAAA");
  EXPECT_EQ(Verdict(text),
            "refused: The reference '#_b2' has the enveloped-signature transform but does not "
            "enclose the signature.");
}

// The transform leaves out only the signature that contains it.
TEST(ReferenceTargetsTest, KeepOtherSignaturesInTheDigest) {
  const SignatureTemplate signature;
  const std::string other = Signed({}, "<Assertion ID=\"_inner\"><Issuer>x</Issuer></Assertion>");
  const std::string text = Signed({}, AssertionWith(signature.Text(), other));
  ASSERT_TRUE(DevSts::VerifyXml(text, Signer().certificatePem));
  EXPECT_EQ(Verdict(text), "valid");
  const std::size_t last = text.rfind("<ds:SignatureValue>");
  EXPECT_EQ(Verdict(text.substr(0, last) +
                    Replaced(text.substr(last), "<ds:SignatureValue>", "<ds:SignatureValue>AAAA")),
            "invalid");
}

TEST(ReferenceTargetsTest, AreAllVerified) {
  SignatureTemplate signature;
  signature.moreReferences =
      "<ds:Reference URI=\"#_more\">" + Transforms({kExclusive}) +
      "<ds:DigestMethod Algorithm=\"http://www.w3.org/2001/04/xmlenc#sha512\"/>"
      "<ds:DigestValue></ds:DigestValue></ds:Reference>";
  const std::string text = Signed({}, "<Envelope>" + AssertionWith(signature.Text()) +
                                          "<Extra ID=\"_more\">more</Extra></Envelope>");
  EXPECT_EQ(Verdict(text), "valid");
  EXPECT_EQ(Verdict(Replaced(text, ">more<", ">less<")), "invalid");
  EXPECT_EQ(Verdict(Replaced(text, "user@example", "root@example")), "invalid");
}

// Wrapping: the signed original is kept in a place where a reader does not look.
TEST(ReferenceTargetsTest, DoNotFollowAWrappedOriginal) {
  const std::string original = Signed();
  const std::string signature =
      "<ds:Signature" + Between(original, "<ds:Signature", "</ds:Signature>") + "</ds:Signature>";
  const std::string bare = Replaced(original, signature, "");
  const std::string forged =
      Replaced(Replaced(bare, "user@example", "root@example"), " ID=\"_a1\"", " ID=\"_evil\"");
  const std::string withSignature =
      Replaced(forged, "</saml:Issuer>", "</saml:Issuer>" + signature);
  EXPECT_EQ(Verdict("<e>" + withSignature + bare + "</e>"),
            "refused: The reference '#_a1' has the enveloped-signature transform but does not "
            "enclose the signature.");
  const std::string sameId = Replaced(withSignature, "_evil", "_a1");
  EXPECT_EQ(Verdict("<e>" + sameId + bare + "</e>"), kAmbiguous);
  EXPECT_EQ(Verdict("<e>" + bare + sameId + "</e>"), kAmbiguous);
}

}  // namespace
}  // namespace Tarnik::Testing
