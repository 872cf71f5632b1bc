#include <string>

#include <gtest/gtest.h>

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

TEST(NewSignatureReferencesTest, ResolvesReferencesWhenItSigns) {
  Request request;
  request.Reference("#body");
  const Ref<ElementNode> body(FindElement(request.document.get(), "Body"));
  body->Parent()->RemoveChild(body.get());
  const std::string blank = XmlText(request.signature->Element());
  EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }),
            "security: No element has the id 'body' of a reference.");
  EXPECT_EQ(XmlText(request.signature->Element()), blank);
  // An element that was moved is found in its new place.
  request.document->RootElement()->FirstChildElement("Header")->AppendChild(body.get());
  request.Reference("#time");
  request.signature->Sign(SignerKey().get());
  request.Place();
  EXPECT_EQ(Verdict(request.Text()), "valid");
  EXPECT_TRUE(DevSts::VerifyXml(request.Text(), Signer().certificatePem));
}

TEST(NewSignatureReferencesTest, SignsTheElementThatEnclosesIt) {
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
  EXPECT_EQ(Verdict(request.Text()), "valid");
  EXPECT_TRUE(DevSts::VerifyXml(request.Text(), Signer().certificatePem));
}

TEST(NewSignatureReferencesTest, SignsTheWholeDocument) {
  Request request;
  request.signature->AddReference("", kSha256)->AddTransform(kEnveloped);
  request.Place();
  request.signature->Sign(SignerKey().get());
  EXPECT_EQ(Verdict(request.Text()), "valid");
  EXPECT_TRUE(DevSts::VerifyXml(request.Text(), Signer().certificatePem));
}

TEST(NewSignatureReferencesTest, RefusesToCoverItselfOrItsAncestors) {
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

TEST(NewSignatureReferencesTest, WithInclusiveCanonicalisationIsSignedOnlyInItsPlace) {
  for (const char* method : {kInclusive, kInclusiveWithComments}) {
    Request request(method);
    request.Reference("#body");
    EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }),
              "security: A signature with inclusive canonicalisation must be in its document "
              "before it is signed.");
    request.Place();
    request.signature->Sign(SignerKey().get());
    EXPECT_EQ(Verdict(request.Text()), "valid");
    EXPECT_TRUE(DevSts::VerifyXml(request.Text(), Signer().certificatePem));
  }
}

// The counterpart of the test above: the place is part of what is signed.
TEST(NewSignatureReferencesTest, WithInclusiveCanonicalisationIsBrokenByAMove) {
  Request request(kInclusive);
  request.Reference("#body");
  request.document->RootElement()->AppendChild(request.signature->Element());
  request.signature->Sign(SignerKey().get());
  EXPECT_EQ(Verdict(request.Text()), "valid");
  request.Place();
  EXPECT_EQ(Verdict(request.Text()), "invalid");
}

TEST(NewSignatureReferencesTest, ResolvesReferencesFromTheTopmostElement) {
  Request request;
  Ref<Signature> signature = Blank(FindElement(request.document.get(), "Timestamp"));
  signature->AddReference("#body", kSha256)->AddTransform(kExclusive);
  signature->Sign(SignerKey().get());
  FindElement(request.document.get(), "Security")->AppendChild(signature->Element());
  EXPECT_EQ(Verdict(request.Text()), "valid");
}

TEST(NewSignatureReferencesTest, SignsTreesWithoutADocument) {
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
  EXPECT_EQ(Verdict(XmlText(root.get())), "valid");
  EXPECT_TRUE(DevSts::VerifyXml(XmlText(root.get()), Signer().certificatePem));
}

struct TargetCase {
  const char* uri;
  const char* refusal;
};

TEST(NewSignatureReferencesTest, RefusesReferencesToNoneOrTwoElements) {
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
    const std::string blank = XmlText(request.signature->Element());
    EXPECT_EQ(Refusal([&] { request.signature->Sign(SignerKey().get()); }), target.refusal);
    EXPECT_EQ(XmlText(request.signature->Element()), blank);
  }
}

TEST(NewSignatureReferencesTest, ConsidersTheIdsOfItsOwnKeyInfo) {
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

}  // namespace
}  // namespace Tarnik::Testing
