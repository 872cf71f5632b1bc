#include "xml/security/reference_targets.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "support/signed_documents.h"

namespace Tarnik::Xml::Security {
namespace {

using Tests::Judge;
using Tests::Replaced;
using Tests::Resigned;
using Tests::Signed;

constexpr const char* kAmbiguous =
    "refused: More than one element has the id '_a1' of a reference.";
constexpr const char* kMissing = "refused: No element has the id '_a1' of a reference.";

/// The signed assertion beside `other`, in one envelope that the signature does not cover.
std::string Beside(const std::string& other, bool behind = true) {
  const std::string assertion = Signed();
  return "<e:Envelope xmlns:e=\"urn:e\">" + (behind ? assertion + other : other + assertion) +
         "</e:Envelope>";
}

TEST(ReferenceTargets, IsTheOneElementWithTheId) {
  EXPECT_EQ(Judge(Beside("<x ID=\"_a2\" other=\"_a1\">_a1</x>")), "valid");
}

class SecondId : public ::testing::TestWithParam<const char*> {};

TEST_P(SecondId, IsRefusedOnAnotherElement) {
  const std::string attribute = GetParam();
  for (const bool behind : {true, false}) {
    EXPECT_EQ(Judge(Beside("<x " + attribute + "=\"_a1\"/>", behind)), kAmbiguous);
    EXPECT_EQ(Judge(Beside("<y><x " + attribute + "=\" _a1\n\"/></y>", behind)), kAmbiguous);
    EXPECT_EQ(Judge(Beside("<x " + attribute + "=\"_a1x\"/>", behind)), "valid");
  }
  EXPECT_EQ(Judge("<x " + attribute + "=\"_a1\">" + Signed() + "</x>"), kAmbiguous);
}

INSTANTIATE_TEST_SUITE_P(Names, SecondId,
                         ::testing::Values("ID", "Id", "id", "iD", "xml:id",
                                           "xmlns:p=\"urn:p\" p:ID", "xmlns:p=\"urn:p\" p:Id",
                                           "xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
                                           "oasis-200401-wss-wssecurity-utility-1.0.xsd\" wsu:Id",
                                           "xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
                                           "oasis-200401-wss-wssecurity-utility-1.0.xsd\" wsu:ID"));

TEST(ReferenceTargets, RefusesAnIdInsideTheSignature) {
  EXPECT_EQ(Judge(Replaced(Signed(), "<ds:KeyInfo", "<ds:KeyInfo Id=\"_a1\"")), kAmbiguous);
  EXPECT_EQ(Judge(Replaced(Signed(), "<ds:KeyInfo", "<ds:KeyInfo Id=\"_a2\"")), "valid");
}

TEST(ReferenceTargets, RefusesAnIdThatNobodyCarries) {
  const std::string text = Signed();
  EXPECT_EQ(Judge(Replaced(text, " ID=\"_a1\"", " ID=\"_a2\"")), kMissing);
  EXPECT_EQ(Judge(Replaced(text, " ID=\"_a1\"", " ID=\"_a1 \"")), kMissing);
  EXPECT_EQ(Judge(Replaced(text, " ID=\"_a1\"", " iD=\"_a1\"")), kMissing);
  EXPECT_EQ(Judge(Replaced(text, " ID=\"_a1\"", " saml:ID=\"_a1\"")), kMissing);
  EXPECT_EQ(Judge(Replaced(text, " ID=\"_a1\"", " IDs=\"_a1\"")), kMissing);
}

/// A document that carries its id in another attribute and is signed rightly.
std::string SignedWithId(const std::string& attribute) {
  Tests::SignatureTemplate signature;
  signature.uri = "#_b2";
  signature.transforms = Tests::Transforms({"http://www.w3.org/2001/10/xml-exc-c14n#"});
  return "<Envelope>" + signature.Text() + "<Body " + attribute + "=\"_b2\">text</Body></Envelope>";
}

TEST(ReferenceTargets, AreFoundByEveryTrueIdAttribute) {
  for (const char* attribute : {"ID", "Id",
                                "xmlns:u=\"http://docs.oasis-open.org/wss/2004/01/"
                                "oasis-200401-wss-wssecurity-utility-1.0.xsd\" u:Id"}) {
    const std::string text = Signed({}, SignedWithId(attribute));
    EXPECT_EQ(Judge(text), "valid") << attribute;
    EXPECT_EQ(Judge(Replaced(text, "text", "tampered")), "invalid") << attribute;
  }
}

class ReferenceUri : public ::testing::TestWithParam<const char*> {};

TEST_P(ReferenceUri, OfAnotherFormIsRefused) {
  Tests::SignatureTemplate signature;
  signature.uri = GetParam();
  const std::string judgement = Judge(Tests::AssertionWithValues(signature));
  EXPECT_THAT(judgement, ::testing::StartsWith("refused: The reference '"));
  EXPECT_THAT(judgement, ::testing::EndsWith("' is not of the form '#id' within the document."));
}

INSTANTIATE_TEST_SUITE_P(Forms, ReferenceUri,
                         ::testing::Values("#", "##_a1", "# _a1", "#_a1 ", " #_a1", "_a1",
                                           "#xpointer(/)", "#xpointer(id('_a1'))", "#id('_a1')",
                                           "#element(/1)", "#_a1'", "#&quot;_a1&quot;", "#%5Fa1",
                                           "#1a", "#-a", "#a:b", "#\xC3\xA4", "file:///etc/passwd",
                                           "http://127.0.0.1:1/x", "document.xml#_a1", "?x",
                                           "cid:x", "#_a1#_a1", "#_a1&#10;"));

TEST(ReferenceTargets, AcceptTheFormThatTheOthersAreNot) {
  Tests::SignatureTemplate signature;
  EXPECT_EQ(Judge(Tests::AssertionWithValues(signature)), "invalid");
  signature.uri = "#_a1.b-C9";
  EXPECT_EQ(Judge(Tests::AssertionWithValues(signature)),
            "refused: No element has the id '_a1.b-C9' of a reference.");
}

TEST(ReferenceTargets, IsTheWholeDocumentForAnEmptyUri) {
  Tests::SignatureTemplate signature;
  signature.uri = "";
  const std::string text =
      Signed({}, "<?style sheet?><!-- c -->" + Tests::AssertionWith(signature.Text()) + "<?end?>");
  ASSERT_TRUE(DevSts::VerifyXml(text, Tests::Signer().certificatePem));
  EXPECT_EQ(Judge(text), "valid");
  EXPECT_EQ(Judge(Replaced(text, "<!-- c -->", "")), "valid");
  EXPECT_EQ(Judge(Replaced(text, "<?end?>", "")), "invalid");
  EXPECT_EQ(Judge(Replaced(text, "user@example", "root@example")), "invalid");
  const std::size_t root = text.find("<Assertion");
  const std::string assertion = text.substr(root, text.find("<?end") - root);
  EXPECT_EQ(Judge("<Envelope>" + assertion + "</Envelope>"), "invalid");
}

TEST(ReferenceTargets, IsTheTreeOfAnElementThatHasNoDocument) {
  Tests::SignatureTemplate signature;
  signature.uri = "";
  const auto document = Tests::ParseDocument(Signed({}, Tests::AssertionWith(signature.Text())));
  ElementNode* root = document->RootElement();
  ElementNode* element = Tests::FindElement(document.get(), "Signature");
  document->RemoveChild(root);
  const auto resolver = Tests::Trusting(Tests::Signer());
  EXPECT_TRUE(CreateSignatureFromDom(element)->Verify(resolver.get()));
  root->SetAttribute("more", "1");
  EXPECT_FALSE(CreateSignatureFromDom(element)->Verify(resolver.get()));
}

TEST(ReferenceTargets, MustNotLieInTheSignature) {
  Tests::SignatureTemplate signature;
  signature.uri = "#_k";
  signature.keyInfo = "<ds:KeyInfo Id=\"_k\"><ds:KeyName>x</ds:KeyName></ds:KeyInfo>";
  EXPECT_EQ(Judge(Tests::AssertionWithValues(signature)),
            "refused: The reference '#_k' points into the signature itself.");
  std::string text = Tests::AssertionWithValues(signature);
  text = Replaced(text, " Id=\"_k\"", "");
  text = Replaced(text, "<ds:Signature ", "<ds:Signature Id=\"_k\" ");
  EXPECT_EQ(Judge(text), "refused: The reference '#_k' points into the signature itself.");
  signature.transforms = Tests::Transforms({"http://www.w3.org/2001/10/xml-exc-c14n#"});
  EXPECT_EQ(Judge(Tests::AssertionWithValues(signature)),
            "refused: The reference '#_k' points into the signature itself.");
}

TEST(ReferenceTargets, ThatEnclosesTheSignatureNeedsTheEnvelopedTransform) {
  Tests::SignatureTemplate signature;
  EXPECT_EQ(Judge(Signed({}, Tests::AssertionWith(signature.Text()))), "valid");
  signature.transforms = Tests::Transforms({"http://www.w3.org/2001/10/xml-exc-c14n#"});
  EXPECT_EQ(Judge(Tests::AssertionWithValues(signature)),
            "refused: The reference '#_a1' encloses the signature without the "
            "enveloped-signature transform.");
  signature.uri = "";
  EXPECT_EQ(Judge(Tests::AssertionWithValues(signature)),
            "refused: The reference '' encloses the signature without the enveloped-signature "
            "transform.");
}

TEST(ReferenceTargets, OutsideTheSignatureMustNotHaveTheEnvelopedTransform) {
  Tests::SignatureTemplate signature;
  signature.uri = "#_b2";
  std::string text = Replaced(SignedWithId("ID"), "<ds:Transforms>",
                              "<ds:Transforms><ds:Transform Algorithm=\"http://www.w3.org/2000/09/"
                              "xmldsig#enveloped-signature\"/>");
  text = Replaced(text, "<ds:DigestValue>", "<ds:DigestValue>AAAA");
  text = Replaced(text, "<ds:SignatureValue>", "<ds:SignatureValue>AAAA");
  EXPECT_EQ(Judge(text),
            "refused: The reference '#_b2' has the enveloped-signature transform but does not "
            "enclose the signature.");
}

// The transform leaves out the signature that it stands in, and no other.
TEST(ReferenceTargets, KeepOtherSignaturesInTheDigest) {
  const Tests::SignatureTemplate signature;
  const std::string other = Signed({}, "<Assertion ID=\"_inner\"><Issuer>x</Issuer></Assertion>");
  const std::string text = Signed({}, Tests::AssertionWith(signature.Text(), other));
  ASSERT_TRUE(DevSts::VerifyXml(text, Tests::Signer().certificatePem));
  EXPECT_EQ(Judge(text), "valid");
  const std::size_t last = text.rfind("<ds:SignatureValue>");
  EXPECT_EQ(Judge(text.substr(0, last) +
                  Replaced(text.substr(last), "<ds:SignatureValue>", "<ds:SignatureValue>AAAA")),
            "invalid");
}

TEST(ReferenceTargets, AllOfThemAreVerified) {
  Tests::SignatureTemplate signature;
  signature.moreReferences =
      "<ds:Reference URI=\"#_more\">" +
      Tests::Transforms({"http://www.w3.org/2001/10/xml-exc-c14n#"}) +
      "<ds:DigestMethod Algorithm=\"http://www.w3.org/2001/04/xmlenc#sha512\"/>"
      "<ds:DigestValue></ds:DigestValue></ds:Reference>";
  const std::string text = Signed({}, "<Envelope>" + Tests::AssertionWith(signature.Text()) +
                                          "<Extra ID=\"_more\">more</Extra></Envelope>");
  EXPECT_EQ(Judge(text), "valid");
  EXPECT_EQ(Judge(Replaced(text, ">more<", ">less<")), "invalid");
  EXPECT_EQ(Judge(Replaced(text, "user@example", "root@example")), "invalid");
}

// Wrapping: the signed original is kept where it no longer is what a reader looks at.
TEST(ReferenceTargets, DoNotFollowAWrappedOriginal) {
  const std::string original = Signed();
  const std::string signature = "<ds:Signature" +
                                Tests::Between(original, "<ds:Signature", "</ds:Signature>") +
                                "</ds:Signature>";
  const std::string bare = Replaced(original, signature, "");
  const std::string forged =
      Replaced(Replaced(bare, "user@example", "root@example"), " ID=\"_a1\"", " ID=\"_evil\"");
  const std::string carrying = Replaced(forged, "</saml:Issuer>", "</saml:Issuer>" + signature);
  EXPECT_EQ(Judge("<e>" + carrying + bare + "</e>"),
            "refused: The reference '#_a1' has the enveloped-signature transform but does not "
            "enclose the signature.");
  const std::string sameId = Replaced(carrying, "_evil", "_a1");
  EXPECT_EQ(Judge("<e>" + sameId + bare + "</e>"), kAmbiguous);
  EXPECT_EQ(Judge("<e>" + bare + sameId + "</e>"), kAmbiguous);
}

}  // namespace
}  // namespace Tarnik::Xml::Security
