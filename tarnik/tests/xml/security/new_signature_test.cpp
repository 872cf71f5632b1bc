#include "xml/security/new_signature.h"

#include <atomic>
#include <cstddef>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>

#include "support/algorithm_uris.h"
#include "support/new_signatures.h"
#include "support/signed_documents.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;

TEST(NewSignatureTest, HasTheStructureOfTheSchemaWithoutLineBreaks) {
  Request request;
  request.signature->AddReference("#body", kSha256);
  request.Reference("#time");
  const std::string blank = XmlText(request.signature->Element());
  EXPECT_EQ(blank,
            "<ds:Signature xmlns:ds=\"http://www.w3.org/2000/09/xmldsig#\"><ds:SignedInfo>"
            "<ds:CanonicalizationMethod "
            "Algorithm=\"http://www.w3.org/2001/10/xml-exc-c14n#\"/>"
            "<ds:SignatureMethod "
            "Algorithm=\"http://www.w3.org/2001/04/xmldsig-more#rsa-sha256\"/>"
            "<ds:Reference URI=\"#body\"><ds:DigestMethod "
            "Algorithm=\"http://www.w3.org/2001/04/xmlenc#sha256\"/>"
            "<ds:DigestValue></ds:DigestValue></ds:Reference>"
            "<ds:Reference URI=\"#time\"><ds:Transforms><ds:Transform "
            "Algorithm=\"http://www.w3.org/2001/10/xml-exc-c14n#\"/></ds:Transforms>"
            "<ds:DigestMethod "
            "Algorithm=\"http://www.w3.org/2001/04/xmlenc#sha256\"/>"
            "<ds:DigestValue></ds:DigestValue></ds:Reference></ds:SignedInfo>"
            "<ds:SignatureValue></ds:SignatureValue></ds:Signature>");
  request.signature->Sign(SignerKey().get());
  const std::string made = XmlText(request.signature->Element());
  EXPECT_EQ(made.find('\n'), std::string::npos);
  EXPECT_EQ(Between(made, "<ds:SignatureValue>", "</ds:SignatureValue>").size(), 344U);
  EXPECT_EQ(Between(made, "<ds:DigestValue>", "</ds:DigestValue>").size(), 44U);
  EXPECT_EQ(made.find("KeyInfo"), std::string::npos);
}

TEST(NewSignatureTest, CanBeReadLikeAParsedSignatureOnceItIsSigned) {
  Request request;
  const auto& signature = *request.signature;
  EXPECT_EQ(signature.CanonicalizationMethod(), kExclusive);
  EXPECT_EQ(signature.SignatureMethod(), kRsaSha256);
  const std::string blank = "state: The signature is not signed yet.";
  EXPECT_EQ(Refusal([&] { signature.References(); }), blank);
  EXPECT_EQ(Refusal([&] { signature.KeyInfo(); }), blank);
  EXPECT_EQ(Refusal([&] { signature.Verify(nullptr); }), blank);

  const Ref<Document> read = ParseXml(request.SignedText());
  const Ref<Signature> other = CreateSignatureFromDom(FindElement(read.get(), "Signature"));
  ASSERT_EQ(signature.References().size(), other->References().size());
  for (std::size_t i = 0; i < signature.References().size(); ++i) {
    EXPECT_EQ(signature.References()[i].uri, other->References()[i].uri);
    EXPECT_EQ(signature.References()[i].digestMethod, other->References()[i].digestMethod);
    EXPECT_EQ(signature.References()[i].transforms, other->References()[i].transforms);
    EXPECT_EQ(signature.References()[i].digestValue, other->References()[i].digestValue);
  }
  EXPECT_EQ(signature.KeyInfo().element, nullptr);
  EXPECT_TRUE(signature.Verify(Trusting(Signer()).get()));
}

TEST(NewSignatureTest, CannotBeChangedOnceItIsSigned) {
  Request request;
  const auto reference = request.signature->AddReference("#body", kSha256);
  request.SignedText();
  const std::string refusal = "state: A signature cannot be changed once it is signed.";
  EXPECT_EQ(Refusal([&] { request.signature->AddReference("#time", kSha256); }), refusal);
  EXPECT_EQ(Refusal([&] { request.signature->SetKeyInfo(request.document->RootElement()); }),
            refusal);
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }), refusal);
  EXPECT_EQ(Refusal([&] { reference->AddTransform(kExclusive); }), refusal);
  EXPECT_EQ(Verdict(request.Text()), "valid");
}

TEST(NewSignatureTest, ParsedSignatureCannotBeChanged) {
  Request request;
  const Ref<Document> read = ParseXml(request.SignedText());
  const Ref<Signature> signature = CreateSignatureFromDom(FindElement(read.get(), "Signature"));
  const std::string refusal = "state: A signature that was read from a document cannot be changed.";
  EXPECT_EQ(Refusal([&] { signature->AddReference("#time", kSha256); }), refusal);
  EXPECT_EQ(Refusal([&] { signature->SetKeyInfo(read->RootElement()); }), refusal);
  EXPECT_EQ(Refusal([&] { signature->Sign(SignerKey().get()); }), refusal);
}

TEST(NewSignatureTest, AcceptsAnIdOnItsElementAfterSigning) {
  Request request;
  request.SignedText();
  request.signature->Element()->SetAttribute("Id", "proof");
  EXPECT_EQ(Verdict(request.Text()), "valid");
  EXPECT_TRUE(DevSts::VerifyXml(request.Text(), Signer().certificatePem));
}

TEST(NewSignatureTest, MayBePlacedWhereItsPrefixHasAnotherBinding) {
  const std::string text = Replaced(kRequest, "<w:Security ", "<w:Security xmlns:ds=\"urn:x\" ");
  Request request(kExclusive, kRsaSha256, "ds", text.c_str());
  const std::string made = request.SignedText();
  EXPECT_EQ(Verdict(made), "valid");
  EXPECT_TRUE(DevSts::VerifyXml(made, Signer().certificatePem));
}

TEST(NewSignatureTest, MayHaveAnyPrefixOrNone) {
  for (const char* prefix : {"", "ds", "sig-1"}) {
    Request request(kExclusive, kRsaSha256, prefix);
    const std::string made = request.SignedText();
    EXPECT_EQ(Verdict(made), "valid") << prefix;
    EXPECT_TRUE(DevSts::VerifyXml(made, Signer().certificatePem)) << prefix;
  }
}

TEST(NewSignatureTest, ContainsTheKeyInfoThatWasSetLast) {
  Request request;
  Ref<ElementNode> first;
  CreateElementNode("", "first", first);
  first->SetAttribute("xmlns", "urn:k");
  request.signature->SetKeyInfo(first.get());
  Ref<ElementNode> second;
  CreateElementNode("k", "Token", second);
  second->SetAttribute("xmlns:k", "urn:k");
  request.signature->SetKeyInfo(second.get());
  const std::string made = request.SignedText();
  EXPECT_NE(made.find("</ds:SignatureValue><ds:KeyInfo><k:Token xmlns:k=\"urn:k\"/>"
                      "</ds:KeyInfo></ds:Signature>"),
            std::string::npos)
      << made;
  EXPECT_EQ(made.find("first"), std::string::npos);
  ASSERT_NE(request.signature->KeyInfo().element, nullptr);
  EXPECT_EQ(request.signature->KeyInfo().element->LocalName(), "KeyInfo");
  EXPECT_EQ(Verdict(made), "valid");
}

TEST(NewSignatureTest, RefusesKeyInfoThatAReaderWouldRefuse) {
  Request request;
  Ref<ElementNode> good;
  CreateElementNode("ds", "KeyName", good);
  Ref<TextNode> name;
  CreateTextNode(name);
  name->SetText("me");
  good->AppendChild(name.get());
  request.signature->SetKeyInfo(good.get());
  Ref<ElementNode> bad;
  CreateElementNode("ds", "RetrievalMethod", bad);
  EXPECT_EQ(Refusal([&] { request.signature->SetKeyInfo(bad.get()); }),
            "syntax: Element 'ds:KeyInfo' may not hold 'ds:RetrievalMethod'.");
  const std::string none =
      "argument: The content of KeyInfo must be an element outside of the signature.";
  EXPECT_EQ(Refusal([&] { request.signature->SetKeyInfo(nullptr); }), none);
  EXPECT_EQ(Refusal([&] { request.signature->SetKeyInfo(request.signature->Element()); }), none);
  const std::string made = request.SignedText();
  EXPECT_THAT(request.signature->KeyInfo().keyNames, testing::ElementsAre("me"));
  EXPECT_THAT(made, testing::HasSubstr("<ds:KeyInfo><ds:KeyName>me</ds:KeyName></ds:KeyInfo>"
                                       "</ds:Signature>"));
  EXPECT_EQ(Verdict(made), "valid");
}

TEST(NewSignatureTest, RefusesItsOwnPartsAsKeyInfo) {
  Request request;
  request.Reference("#body");
  Ref<ElementNode> token;
  CreateElementNode("", "Token", token);
  request.signature->SetKeyInfo(token.get());
  const std::string blank = XmlText(request.signature->Element());
  for (const char* part : {"SignedInfo", "Reference", "SignatureValue", "KeyInfo", "Token"}) {
    ElementNode* element = FindElement(request.signature->Element(), part);
    ASSERT_NE(element, nullptr) << part;
    EXPECT_EQ(Refusal([&] { request.signature->SetKeyInfo(element); }),
              "argument: The content of KeyInfo must be an element outside of the signature.")
        << part;
    EXPECT_EQ(XmlText(request.signature->Element()), blank) << part;
  }
  request.signature->Sign(SignerKey().get());
  request.Place();
  EXPECT_EQ(Verdict(request.Text()), "valid");
}

TEST(NewSignatureTest, RefusesAnElementAroundItselfAsKeyInfo) {
  Request request;
  request.Reference("#body");
  request.Place();
  const std::string blank = request.Text();
  EXPECT_EQ(Refusal([&] { request.signature->SetKeyInfo(request.document->RootElement()); }),
            "argument: The content of KeyInfo must be an element outside of the signature.");
  EXPECT_EQ(request.Text(), blank);
}

TEST(NewSignatureTest, RefusesAKeyInfoThatContainsASignedElement) {
  Request request;
  request.Reference("#body");
  request.signature->SetKeyInfo(FindElement(request.document.get(), "Body"));
  const std::string inside = "security: The reference '#body' points into the signature itself.";
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }), inside);
  request.Place();
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }), inside);
}

TEST(NewSignatureTest, RefusesAKeyInfoThatContainsTheWholeDocument) {
  Request request;
  request.signature->AddReference("", kSha256)->AddTransform(kEnveloped);
  request.Reference("#body");
  request.signature->SetKeyInfo(request.document->RootElement());
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }),
            "security: The reference '' points into the signature itself.");
}

TEST(NewSignatureTest, RefusesUnsupportedAlgorithmsAtOnce) {
  Request request;
  ElementNode* root = request.document->RootElement();
  EXPECT_EQ(Refusal([&] { Blank(root, "urn:c14n"); }),
            "security: The canonicalisation algorithm 'urn:c14n' is not supported.");
  EXPECT_EQ(Refusal([&] { Blank(root, kExclusive, "http://www.w3.org/2000/09/xmldsig#rsa-sha1"); }),
            "security: The signature algorithm 'http://www.w3.org/2000/09/xmldsig#rsa-sha1' is not "
            "supported.");
  const std::string blank = XmlText(request.signature->Element());
  EXPECT_EQ(Refusal([&] {
              request.signature->AddReference("#body", "http://www.w3.org/2000/09/xmldsig#sha1");
            }),
            "security: The digest algorithm 'http://www.w3.org/2000/09/xmldsig#sha1' is not "
            "supported.");
  EXPECT_EQ(XmlText(request.signature->Element()), blank);
  const auto reference = request.signature->AddReference("#body", kSha256);
  EXPECT_EQ(Refusal([&] { reference->AddTransform("urn:transform"); }),
            "security: The transform algorithm 'urn:transform' is not supported.");
  reference->AddTransform(kExclusive);
  EXPECT_EQ(Refusal([&] { reference->AddTransform(kEnveloped); }),
            std::string("security: The transform algorithm '") + kEnveloped +
                "' is not supported after a canonicalisation.");
  request.signature->Sign(SignerKey().get());
  request.Place();
  EXPECT_EQ(Verdict(request.Text()), "valid");
  EXPECT_THAT(request.signature->References().front().transforms, testing::ElementsAre(kExclusive));
}

TEST(NewSignatureTest, RefusesInvalidArguments) {
  Request request;
  ElementNode* root = request.document->RootElement();
  EXPECT_EQ(Refusal([] { Blank(nullptr); }),
            "argument: A signature cannot be made for a null element.");
  EXPECT_EQ(Refusal([&] { Blank(root, kExclusive, kRsaSha256, "xmlns"); }),
            "argument: The prefix 'xmlns' of a signature is reserved.");
  EXPECT_EQ(Refusal([&] { Blank(root, kExclusive, kRsaSha256, "xml"); }),
            "argument: The prefix 'xml' of a signature is reserved.");
  EXPECT_EQ(Refusal([&] { Blank(root, kExclusive, kRsaSha256, "a:b"); }).find("argument: "), 0U);
  EXPECT_EQ(Refusal([&] { request.signature->AddReference("#\x01", kSha256); }).find("argument: "),
            0U);
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }),
            "state: A signature needs at least one reference.");
  request.Reference("#body");
  EXPECT_EQ(Refusal([&] { request.signature->Sign(nullptr); }),
            "argument: A signature cannot be made without a private key.");
}

TEST(NewSignatureTest, AcceptsAtMostSixteenReferences) {
  Request request;
  for (int i = 0; i < 16; ++i) {
    request.Reference(i % 2 == 0 ? "#body" : "#time");
  }
  EXPECT_EQ(Refusal([&] { request.signature->AddReference("#body", kSha256); }),
            "state: A signature may have no more than 16 references.");
  request.signature->Sign(SignerKey().get());
  request.Place();
  EXPECT_EQ(Verdict(request.Text()), "valid");
}

TEST(NewSignatureTest, IsBlankAgainWhenSigningFailsHalfway) {
  Request request;
  request.Reference("#body");
  request.Reference("#time");
  ElementNode* time = FindElement(request.document.get(), "Timestamp");
  time->SetAttribute("xmlns:relative", "not/absolute");
  const std::string blank = XmlText(request.signature->Element());
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }),
            "security: Element 'w:Timestamp' declares a namespace with a relative URI.");
  EXPECT_EQ(XmlText(request.signature->Element()), blank);
  time->RemoveAttribute("xmlns:relative");
  request.signature->Sign(SignerKey().get());
  request.Place();
  EXPECT_EQ(Verdict(request.Text()), "valid");
}

TEST(NewSignatureTest, ThreadsMaySignWithOneKey) {
  constexpr int kThreads = 8;
  std::atomic<int> valid{0};
  std::vector<std::thread> threads;
  for (int i = 0; i < kThreads; ++i) {
    threads.emplace_back([&valid] {
      for (int round = 0; round < 5; ++round) {
        Request request;
        valid += Verdict(request.SignedText()) == "valid" ? 1 : 0;
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(valid, 5 * kThreads);
}

}  // namespace
}  // namespace Tarnik::Testing
