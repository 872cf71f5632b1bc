#include "xml/security/new_signature.h"

#include <atomic>
#include <thread>

#include "support/new_signatures.h"

namespace Tarnik::Xml::Security {
namespace {

using namespace Testing;

TEST(NewSignature, HasTheStructureOfTheSchemaWithoutLineBreaks) {
  Request request;
  request.signature->AddReference("#body", kSha256);
  request.Reference("#time");
  const std::string blank = TextOf(request.signature->Element());
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
  const std::string made = TextOf(request.signature->Element());
  EXPECT_EQ(made.find('\n'), std::string::npos);
  EXPECT_EQ(Tests::Between(made, "<ds:SignatureValue>", "</ds:SignatureValue>").size(), 344U);
  EXPECT_EQ(Tests::Between(made, "<ds:DigestValue>", "</ds:DigestValue>").size(), 44U);
  EXPECT_EQ(made.find("KeyInfo"), std::string::npos);
}

TEST(NewSignature, IsReadLikeOneFromADocumentOnceItIsSigned) {
  Request request;
  const auto& signature = *request.signature;
  EXPECT_EQ(signature.CanonicalizationMethod(), kExclusive);
  EXPECT_EQ(signature.SignatureMethod(), kRsaSha256);
  const std::string blank = "state: The signature is not signed yet.";
  EXPECT_EQ(Refusal([&] { signature.References(); }), blank);
  EXPECT_EQ(Refusal([&] { signature.KeyInfo(); }), blank);
  EXPECT_EQ(Refusal([&] { signature.Verify(nullptr); }), blank);

  const Ref<Document> read = Tests::ParseDocument(request.SignedText());
  const Ref<Signature> other = CreateSignatureFromDom(Tests::FindElement(read.get(), "Signature"));
  ASSERT_EQ(signature.References().size(), other->References().size());
  for (std::size_t i = 0; i < signature.References().size(); ++i) {
    EXPECT_EQ(signature.References()[i].uri, other->References()[i].uri);
    EXPECT_EQ(signature.References()[i].digestMethod, other->References()[i].digestMethod);
    EXPECT_EQ(signature.References()[i].transforms, other->References()[i].transforms);
    EXPECT_EQ(signature.References()[i].digestValue, other->References()[i].digestValue);
  }
  EXPECT_EQ(signature.KeyInfo().element, nullptr);
  EXPECT_TRUE(signature.Verify(Tests::Trusting(Tests::Signer()).get()));
}

TEST(NewSignature, CannotBeChangedOnceItIsSigned) {
  Request request;
  const auto reference = request.signature->AddReference("#body", kSha256);
  request.SignedText();
  const std::string refusal = "state: A signature cannot be changed once it is signed.";
  EXPECT_EQ(Refusal([&] { request.signature->AddReference("#time", kSha256); }), refusal);
  EXPECT_EQ(Refusal([&] { request.signature->SetKeyInfo(request.document->RootElement()); }),
            refusal);
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }), refusal);
  EXPECT_EQ(Refusal([&] { reference->AddTransform(kExclusive); }), refusal);
  EXPECT_EQ(Tests::Judge(request.Text()), "valid");
}

TEST(NewSignature, LeavesThoseThatWereReadUnchangeable) {
  Request request;
  const Ref<Document> read = Tests::ParseDocument(request.SignedText());
  const Ref<Signature> signature =
      CreateSignatureFromDom(Tests::FindElement(read.get(), "Signature"));
  const std::string refusal = "state: A signature that was read from a document cannot be changed.";
  EXPECT_EQ(Refusal([&] { signature->AddReference("#time", kSha256); }), refusal);
  EXPECT_EQ(Refusal([&] { signature->SetKeyInfo(read->RootElement()); }), refusal);
  EXPECT_EQ(Refusal([&] { signature->Sign(SignerKey().get()); }), refusal);
}

TEST(NewSignature, TakesAnIdOnItsElementAfterSigning) {
  Request request;
  request.SignedText();
  request.signature->Element()->SetAttribute("Id", "proof");
  EXPECT_EQ(Tests::Judge(request.Text()), "valid");
  EXPECT_TRUE(DevSts::VerifyXml(request.Text(), Tests::Signer().certificatePem));
}

TEST(NewSignature, MayStandWhereOtherBindingsOfItsPrefixAreInScope) {
  const std::string text =
      Tests::Replaced(kRequest, "<w:Security ", "<w:Security xmlns:ds=\"urn:x\" ");
  Request request(kExclusive, kRsaSha256, "ds", text.c_str());
  const std::string made = request.SignedText();
  EXPECT_EQ(Tests::Judge(made), "valid");
  EXPECT_TRUE(DevSts::VerifyXml(made, Tests::Signer().certificatePem));
}

TEST(NewSignature, MayHaveAnyPrefixOrNone) {
  for (const char* prefix : {"", "ds", "sig-1"}) {
    Request request(kExclusive, kRsaSha256, prefix);
    const std::string made = request.SignedText();
    EXPECT_EQ(Tests::Judge(made), "valid") << prefix;
    EXPECT_TRUE(DevSts::VerifyXml(made, Tests::Signer().certificatePem)) << prefix;
  }
}

TEST(NewSignature, CarriesTheKeyInfoThatWasSetLast) {
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
  EXPECT_EQ(Tests::Judge(made), "valid");
}

TEST(NewSignature, RefusesKeyInfoThatAReaderWouldRefuse) {
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
  EXPECT_EQ(Tests::Judge(made), "valid");
}

TEST(NewSignature, KeepsItsOwnPartsOutOfItsKeyInfo) {
  Request request;
  request.Reference("#body");
  Ref<ElementNode> token;
  CreateElementNode("", "Token", token);
  request.signature->SetKeyInfo(token.get());
  const std::string blank = TextOf(request.signature->Element());
  for (const char* part : {"SignedInfo", "Reference", "SignatureValue", "KeyInfo", "Token"}) {
    ElementNode* element = Tests::FindElement(request.signature->Element(), part);
    ASSERT_NE(element, nullptr) << part;
    EXPECT_EQ(Refusal([&] { request.signature->SetKeyInfo(element); }),
              "argument: The content of KeyInfo must be an element outside of the signature.")
        << part;
    EXPECT_EQ(TextOf(request.signature->Element()), blank) << part;
  }
  request.signature->Sign(SignerKey().get());
  request.Place();
  EXPECT_EQ(Tests::Judge(request.Text()), "valid");
}

TEST(NewSignature, RefusesAKeyInfoThatHoldsWhatIsSigned) {
  Request request;
  request.Reference("#body");
  request.signature->SetKeyInfo(Tests::FindElement(request.document.get(), "Body"));
  const std::string inside = "security: The reference '#body' points into the signature itself.";
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }), inside);
  request.Place();
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }), inside);
}

TEST(NewSignature, RefusesAKeyInfoThatHoldsTheWholeDocument) {
  Request request;
  request.signature->AddReference("", kSha256)->AddTransform(kEnveloped);
  request.Reference("#body");
  request.signature->SetKeyInfo(request.document->RootElement());
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }),
            "security: The reference '' points into the signature itself.");
}

TEST(NewSignature, LooksForReferencesWhenItSigns) {
  Request request;
  request.Reference("#body");
  const Ref<ElementNode> body(Tests::FindElement(request.document.get(), "Body"));
  body->Parent()->RemoveChild(body.get());
  const std::string blank = TextOf(request.signature->Element());
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }),
            "security: No element has the id 'body' of a reference.");
  EXPECT_EQ(TextOf(request.signature->Element()), blank);
  // What is put elsewhere is found there.
  request.document->RootElement()->FirstChildElement("Header")->AppendChild(body.get());
  request.Reference("#time");
  request.signature->Sign(SignerKey().get());
  request.Place();
  EXPECT_EQ(Tests::Judge(request.Text()), "valid");
  EXPECT_TRUE(DevSts::VerifyXml(request.Text(), Tests::Signer().certificatePem));
}

TEST(NewSignature, SignsTheElementThatEnclosesIt) {
  Request request;
  request.document->RootElement()->SetAttribute("ID", "all");
  const auto reference = request.signature->AddReference("#all", kSha256);
  reference->AddTransform(kEnveloped);
  reference->AddTransform(kExclusive);
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }),
            "security: The reference '#all' has the enveloped-signature transform but does not "
            "enclose the signature.");
  request.Place();
  request.signature->Sign(SignerKey().get());
  EXPECT_EQ(Tests::Judge(request.Text()), "valid");
  EXPECT_TRUE(DevSts::VerifyXml(request.Text(), Tests::Signer().certificatePem));
}

TEST(NewSignature, SignsTheWholeDocument) {
  Request request;
  request.signature->AddReference("", kSha256)->AddTransform(kEnveloped);
  request.Place();
  request.signature->Sign(SignerKey().get());
  EXPECT_EQ(Tests::Judge(request.Text()), "valid");
  EXPECT_TRUE(DevSts::VerifyXml(request.Text(), Tests::Signer().certificatePem));
}

TEST(NewSignature, RefusesToCoverItselfOrWhatItStandsIn) {
  Request enclosing;
  enclosing.document->RootElement()->SetAttribute("ID", "all");
  enclosing.Reference("#all");
  enclosing.Place();
  EXPECT_EQ(Refusal([&] { enclosing.signature->Sign(SignerKey().get()); }),
            "security: The reference '#all' encloses the signature without the "
            "enveloped-signature transform.");
  Request own;
  own.signature->Element()->SetAttribute("Id", "own");
  own.Reference("#own");
  EXPECT_EQ(Refusal([&] { own.signature->Sign(SignerKey().get()); }),
            "security: The reference '#own' points into the signature itself.");
}

TEST(NewSignature, WithInclusiveCanonicalisationIsSignedInItsPlaceAlone) {
  for (const char* method : {kInclusive, kInclusiveWithComments}) {
    Request request(method);
    request.Reference("#body");
    EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }),
              "security: A signature with inclusive canonicalisation must be in its document "
              "before it is signed.");
    request.Place();
    request.signature->Sign(SignerKey().get());
    EXPECT_EQ(Tests::Judge(request.Text()), "valid");
    EXPECT_TRUE(DevSts::VerifyXml(request.Text(), Tests::Signer().certificatePem));
  }
}

// The twin of the above: the place is part of what is signed.
TEST(NewSignature, WithInclusiveCanonicalisationIsBrokenByAMove) {
  Request request(kInclusive);
  request.Reference("#body");
  request.document->RootElement()->AppendChild(request.signature->Element());
  request.signature->Sign(SignerKey().get());
  EXPECT_EQ(Tests::Judge(request.Text()), "valid");
  request.Place();
  EXPECT_EQ(Tests::Judge(request.Text()), "invalid");
}

TEST(NewSignature, LooksReferencesUpBelowTheTopmostElement) {
  Request request;
  Ref<Signature> signature = Blank(Tests::FindElement(request.document.get(), "Timestamp"));
  signature->AddReference("#body", kSha256)->AddTransform(kExclusive);
  signature->Sign(SignerKey().get());
  Tests::FindElement(request.document.get(), "Security")->AppendChild(signature->Element());
  EXPECT_EQ(Tests::Judge(request.Text()), "valid");
}

TEST(NewSignature, SignsTreesMadeByHandThatNoDocumentHolds) {
  Ref<ElementNode> root;
  CreateElementNode("", "Envelope", root);
  Ref<ElementNode> body;
  CreateElementNode("", "Body", body);
  root->AppendChild(body.get());
  body->SetAttribute("xmlns:wsu",
                     "http://docs.oasis-open.org/wss/2004/01/"
                     "oasis-200401-wss-wssecurity-utility-1.0.xsd");
  body->SetAttribute("wsu:Id", "Body-1");
  const Ref<Signature> signature = Blank(root.get());
  signature->AddReference("#Body-1", kSha256)->AddTransform(kExclusive);
  signature->Sign(SignerKey().get());
  root->AppendChild(signature->Element());
  EXPECT_EQ(Tests::Judge(TextOf(root.get())), "valid");
  EXPECT_TRUE(DevSts::VerifyXml(TextOf(root.get()), Tests::Signer().certificatePem));
}

struct TargetCase {
  const char* uri;
  const char* refusal;
};

TEST(NewSignature, RefusesReferencesThatHitNothingOrTwo) {
  const TargetCase cases[] = {
      {"#nothing", "security: No element has the id 'nothing' of a reference."},
      {"#twice", "security: More than one element has the id 'twice' of a reference."},
      {"body", "security: The reference 'body' is not of the form '#id' within the document."},
      {"http://host/x",
       "security: The reference 'http://host/x' is not of the form '#id' within the document."},
  };
  for (const TargetCase& target : cases) {
    Request request(kExclusive, kRsaSha256, "ds",
                    "<a><b Id=\"twice\"/><c ID=\"twice\"/><w:Security xmlns:w=\"urn:w\"/></a>");
    request.Reference(target.uri);
    const std::string blank = TextOf(request.signature->Element());
    EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }), target.refusal);
    EXPECT_EQ(TextOf(request.signature->Element()), blank);
  }
}

TEST(NewSignature, CountsTheIdsOfItsOwnKeyInfo) {
  Request request;
  Ref<ElementNode> token;
  CreateElementNode("k", "Token", token);
  token->SetAttribute("xmlns:k", "urn:k");
  token->SetAttribute("Id", "body");
  request.signature->SetKeyInfo(token.get());
  request.Reference("#body");
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }),
            "security: More than one element has the id 'body' of a reference.");
}

TEST(NewSignature, RefusesAlgorithmsOffTheListAtOnce) {
  Request request;
  ElementNode* root = request.document->RootElement();
  EXPECT_EQ(Refusal([&] { Blank(root, "urn:c14n"); }),
            "security: The canonicalisation algorithm 'urn:c14n' is not supported.");
  EXPECT_EQ(Refusal([&] { Blank(root, kExclusive, "http://www.w3.org/2000/09/xmldsig#rsa-sha1"); }),
            "security: The signature algorithm 'http://www.w3.org/2000/09/xmldsig#rsa-sha1' is not "
            "supported.");
  const std::string blank = TextOf(request.signature->Element());
  EXPECT_EQ(Refusal([&] {
              request.signature->AddReference("#body", "http://www.w3.org/2000/09/xmldsig#sha1");
            }),
            "security: The digest algorithm 'http://www.w3.org/2000/09/xmldsig#sha1' is not "
            "supported.");
  EXPECT_EQ(TextOf(request.signature->Element()), blank);
  const auto reference = request.signature->AddReference("#body", kSha256);
  EXPECT_EQ(Refusal([&] { reference->AddTransform("urn:transform"); }),
            "security: The transform algorithm 'urn:transform' is not supported.");
  reference->AddTransform(kExclusive);
  EXPECT_EQ(Refusal([&] { reference->AddTransform(kEnveloped); }),
            std::string("security: The transform algorithm '") + kEnveloped +
                "' is not supported after a canonicalisation.");
  request.signature->Sign(SignerKey().get());
  request.Place();
  EXPECT_EQ(Tests::Judge(request.Text()), "valid");
  EXPECT_THAT(request.signature->References().front().transforms, testing::ElementsAre(kExclusive));
}

TEST(NewSignature, RefusesArgumentsThatNameNothing) {
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

TEST(NewSignature, TakesSixteenReferences) {
  Request request;
  for (int i = 0; i < 16; ++i) {
    request.Reference(i % 2 == 0 ? "#body" : "#time");
  }
  EXPECT_EQ(Refusal([&] { request.signature->AddReference("#body", kSha256); }),
            "state: A signature may have no more than 16 references.");
  request.signature->Sign(SignerKey().get());
  request.Place();
  EXPECT_EQ(Tests::Judge(request.Text()), "valid");
}

TEST(NewSignature, IsBlankAgainWhenSigningFailsHalfway) {
  Request request;
  request.Reference("#body");
  request.Reference("#time");
  ElementNode* time = Tests::FindElement(request.document.get(), "Timestamp");
  time->SetAttribute("xmlns:relative", "not/absolute");
  const std::string blank = TextOf(request.signature->Element());
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }),
            "security: Element 'w:Timestamp' declares a namespace with a relative URI.");
  EXPECT_EQ(TextOf(request.signature->Element()), blank);
  time->RemoveAttribute("xmlns:relative");
  request.signature->Sign(SignerKey().get());
  request.Place();
  EXPECT_EQ(Tests::Judge(request.Text()), "valid");
}

TEST(NewSignature, ThreadsMaySignWithOneKey) {
  constexpr int kThreads = 8;
  std::atomic<int> valid{0};
  std::vector<std::thread> threads;
  for (int i = 0; i < kThreads; ++i) {
    threads.emplace_back([&valid] {
      for (int round = 0; round < 5; ++round) {
        Request request;
        valid += Tests::Judge(request.SignedText()) == "valid" ? 1 : 0;
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(valid, 5 * kThreads);
}

}  // namespace
}  // namespace Tarnik::Xml::Security
