#include "xml/security/new_signature.h"

#include <openssl/rsa.h>

#include <tarnik/core/exception.h>
#include <tarnik/xml/xml_writer.h>
#include <atomic>
#include <thread>

#include "support/key_texts.h"
#include "support/signed_documents.h"

namespace Tarnik::Xml::Security {
namespace {

using Crypto::PrivateKey;

constexpr const char* kEnveloped = "http://www.w3.org/2000/09/xmldsig#enveloped-signature";
constexpr const char* kExclusive = "http://www.w3.org/2001/10/xml-exc-c14n#";
constexpr const char* kExclusiveWithComments =
    "http://www.w3.org/2001/10/xml-exc-c14n#WithComments";
constexpr const char* kInclusive = "http://www.w3.org/TR/2001/REC-xml-c14n-20010315";
constexpr const char* kInclusiveWithComments =
    "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#WithComments";
constexpr const char* kRsaSha256 = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";
constexpr const char* kEcdsaSha256 = "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256";
constexpr const char* kSha256 = "http://www.w3.org/2001/04/xmlenc#sha256";

/// A request with what canonicalisation must get right: comments, namespaces of the elements
/// around, xml: attributes and characters to escape.
constexpr const char* kRequest =
    "<s:Envelope xmlns:s=\"urn:soap\" xmlns:unused=\"urn:unused\" xml:lang=\"en\">"
    "<s:Header><w:Security xmlns:w=\"urn:wsse\"><w:Timestamp Id=\"time\">now</w:Timestamp>"
    "</w:Security></s:Header>\n"
    "<s:Body xmlns=\"urn:plain\" Id=\"body\" b=\"2\" a=\"1&#10;\"><!-- a remark --><Ask>x &amp; "
    "y&#13;</Ask></s:Body></s:Envelope>";

const Ref<const PrivateKey>& SignerKey() {
  static const auto key = Crypto::CreatePrivateKeyFromPem(Tests::Signer().privateKeyPem);
  return key;
}

std::string TextOf(const Node* node) {
  const Ref<StringWriter> writer = CreateStringWriter();
  WriteXml(node, writer.get());
  return writer->Text();
}

Ref<Signature> Blank(ElementNode* root, const char* c14n = kExclusive,
                     const char* method = kRsaSha256, const char* prefix = "ds") {
  Ref<Signature> signature;
  CreateBlankSignature(root, c14n, method, prefix, signature);
  return signature;
}

/// A request document and a blank signature for it.
struct Request {
  explicit Request(const char* c14n = kExclusive, const char* method = kRsaSha256,
                   const char* prefix = "ds", const char* text = kRequest)
      : document(Tests::ParseDocument(text)),
        signature(Blank(document->RootElement(), c14n, method, prefix)) {}

  void Reference(const char* uri, const char* digest = kSha256,
                 const char* transform = kExclusive) {
    signature->AddReference(uri, digest)->AddTransform(transform);
  }
  void Place() const {
    Tests::FindElement(document.get(), "Security")->AppendChild(signature->Element());
  }
  std::string Text() const { return TextOf(document.get()); }
  std::string SignedText() {
    Reference("#body");
    Reference("#time");
    signature->Sign(SignerKey().get());
    Place();
    return Text();
  }

  Ref<Document> document;
  Ref<Signature> signature;
};

/// The class and message of what `action` throws.
template <class Action>
std::string Refusal(Action action) {
  try {
    action();
  } catch (const SignatureSyntaxException& error) {
    return "syntax: " + error.Message();
  } catch (const XmlSecurityException& error) {
    return "security: " + error.Message();
  } catch (const InvalidStateException& error) {
    return "state: " + error.Message();
  } catch (const InvalidArgumentException& error) {
    return "argument: " + error.Message();
  }
  return "done";
}

struct MethodCase {
  const char* name;
  const char* algorithm;
  DevSts::KeyType key;
  bool isRandomised;
};

const MethodCase kMethods[] = {
    {"RsaSha256", kRsaSha256, DevSts::KeyType::Rsa2048, false},
    {"RsaSha384", "http://www.w3.org/2001/04/xmldsig-more#rsa-sha384", DevSts::KeyType::Rsa2048,
     false},
    {"RsaSha512", "http://www.w3.org/2001/04/xmldsig-more#rsa-sha512", DevSts::KeyType::Rsa2048,
     false},
    {"RsaPssSha256", "http://www.w3.org/2007/05/xmldsig-more#sha256-rsa-MGF1",
     DevSts::KeyType::Rsa2048, true},
    {"RsaPssSha384", "http://www.w3.org/2007/05/xmldsig-more#sha384-rsa-MGF1",
     DevSts::KeyType::Rsa2048, true},
    {"RsaPssSha512", "http://www.w3.org/2007/05/xmldsig-more#sha512-rsa-MGF1",
     DevSts::KeyType::Rsa2048, true},
    {"EcdsaSha256", kEcdsaSha256, DevSts::KeyType::EcP256, true},
    {"EcdsaSha384", "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha384", DevSts::KeyType::EcP384,
     true},
    {"EcdsaSha512", "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha512", DevSts::KeyType::EcP256,
     true},
};

struct DigestCase {
  const char* name;
  const char* algorithm;
};
const DigestCase kDigests[] = {
    {"Sha256", kSha256},
    {"Sha384", "http://www.w3.org/2001/04/xmldsig-more#sha384"},
    {"Sha512", "http://www.w3.org/2001/04/xmlenc#sha512"},
};

struct C14nCase {
  const char* name;
  const char* algorithm;
};
const C14nCase kCanonicalizations[] = {
    {"Exclusive", kExclusive},
    {"ExclusiveWithComments", kExclusiveWithComments},
    {"Inclusive", kInclusive},
    {"InclusiveWithComments", kInclusiveWithComments},
};

class NewSignatureAlgorithms
    : public testing::TestWithParam<std::tuple<MethodCase, DigestCase, C14nCase>> {
 protected:
  NewSignatureAlgorithms()
      : signer_(Tests::SignerOf(std::get<0>(GetParam()).key)),
        stranger_(Tests::SignerOf(std::get<0>(GetParam()).key, "stranger")) {}

  std::string Sign(std::string* value = nullptr) const {
    const auto& [method, digest, c14n] = GetParam();
    Request request(c14n.algorithm, method.algorithm);
    request.Reference("#body", digest.algorithm, c14n.algorithm);
    request.Reference("#time", digest.algorithm, c14n.algorithm);
    request.Place();
    request.signature->Sign(Crypto::CreatePrivateKeyFromPem(signer_.privateKeyPem).get());
    EXPECT_TRUE(request.signature->Verify(Tests::Trusting(signer_).get()));
    EXPECT_FALSE(request.signature->Verify(Tests::Trusting(stranger_).get()));
    if (value != nullptr) {
      *value = TextOf(Tests::FindElement(request.document.get(), "SignatureValue"));
    }
    return request.Text();
  }

  const DevSts::Credential signer_;
  const DevSts::Credential stranger_;
};

TEST_P(NewSignatureAlgorithms, AreMadeAsWeAndTheOracleVerify) {
  const std::string text = Sign();
  EXPECT_EQ(Tests::Judge(text, signer_), "valid");
  const DevSts::VerifyResult verdict = DevSts::VerifyXml(text, signer_.certificatePem);
  EXPECT_TRUE(verdict.valid) << verdict.reason << "\n" << text;
  EXPECT_THAT(verdict.referenceUris, testing::ElementsAre("#body", "#time"));
  EXPECT_FALSE(
      DevSts::VerifyXml(Tests::Replaced(text, ">now<", ">later<"), signer_.certificatePem));
}

TEST_P(NewSignatureAlgorithms, GiveTheSameValueUnlessTheyAreRandomised) {
  std::string first;
  std::string second;
  Sign(&first);
  Sign(&second);
  EXPECT_EQ(first != second, std::get<0>(GetParam()).isRandomised);
}

INSTANTIATE_TEST_SUITE_P(All, NewSignatureAlgorithms,
                         testing::Combine(testing::ValuesIn(kMethods), testing::ValuesIn(kDigests),
                                          testing::ValuesIn(kCanonicalizations)),
                         [](const auto& tested) {
                           return std::string(std::get<0>(tested.param).name) +
                                  std::get<1>(tested.param).name + std::get<2>(tested.param).name;
                         });

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
  const std::string none = "argument: This is no element that KeyInfo could hold.";
  EXPECT_EQ(Refusal([&] { request.signature->SetKeyInfo(nullptr); }), none);
  EXPECT_EQ(Refusal([&] { request.signature->SetKeyInfo(request.signature->Element()); }), none);
  const std::string made = request.SignedText();
  EXPECT_THAT(request.signature->KeyInfo().keyNames, testing::ElementsAre("me"));
  EXPECT_EQ(Tests::Judge(made), "valid");
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
              "security: A signature with inclusive canonicalisation must stand in its document "
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
      {"#nothing", "security: No element carries the id 'nothing' of a reference."},
      {"#twice", "security: The id 'twice' of a reference stands on more than one element."},
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
            "security: The id 'body' of a reference stands on more than one element.");
}

TEST(NewSignature, RefusesAlgorithmsOffTheListAtOnce) {
  Request request;
  ElementNode* root = request.document->RootElement();
  EXPECT_EQ(Refusal([&] { Blank(root, "urn:c14n"); }),
            "security: The canonicalization algorithm 'urn:c14n' is not supported.");
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
                "' is not supported behind a canonicalization.");
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

OpenSsl::OwnedKey MakePssKey() {
  const OpenSsl::OwnedKeyContext context(EVP_PKEY_CTX_new_from_name(nullptr, "RSA-PSS", nullptr));
  EVP_PKEY* key = nullptr;
  EVP_PKEY_keygen_init(context.get());
  EVP_PKEY_CTX_set_rsa_keygen_bits(context.get(), 2048);
  EVP_PKEY_generate(context.get(), &key);
  return OpenSsl::OwnedKey(key);
}

Ref<const PrivateKey> Loaded(const OpenSsl::OwnedKey& key) {
  return Crypto::CreatePrivateKeyFromPem(Tests::ToPkcs8Pem(key.get()));
}

std::string SignRefusal(const char* method, const PrivateKey* key) {
  Request request(kExclusive, method);
  request.Reference("#body");
  const std::string blank = TextOf(request.signature->Element());
  const std::string refusal = Refusal([&] { request.signature->Sign(key); });
  if (refusal != "done") {
    EXPECT_EQ(TextOf(request.signature->Element()), blank);
  }
  return refusal;
}

TEST(NewSignature, RefusesKeysThatDoNotFitTheAlgorithm) {
  const char* const pssSha256 = "http://www.w3.org/2007/05/xmldsig-more#sha256-rsa-MGF1";
  const auto ec = Loaded(Tests::MakeEcKey("P-256"));
  const auto pss = Loaded(MakePssKey());
  const auto edwards = Loaded(Tests::MakeKey("ED25519"));
  EXPECT_EQ(SignRefusal(kRsaSha256, ec.get()),
            std::string("security: The private key is an EC key; the signature algorithm '") +
                kRsaSha256 + "' needs an RSA key.");
  EXPECT_EQ(SignRefusal(kRsaSha256, pss.get()),
            std::string("security: The private key is an RSA-PSS key; the signature algorithm '") +
                kRsaSha256 + "' needs an RSA key.");
  EXPECT_EQ(SignRefusal(pssSha256, ec.get()),
            std::string("security: The private key is an EC key; the signature algorithm '") +
                pssSha256 + "' needs an RSA or RSA-PSS key.");
  EXPECT_EQ(SignRefusal(kEcdsaSha256, SignerKey().get()),
            std::string("security: The private key is an RSA key; the signature algorithm '") +
                kEcdsaSha256 + "' needs an EC key.");
  EXPECT_EQ(SignRefusal(kEcdsaSha256, edwards.get()),
            std::string("security: The private key is neither an RSA nor an EC key; the signature "
                        "algorithm '") +
                kEcdsaSha256 + "' needs an EC key.");
  EXPECT_EQ(SignRefusal(pssSha256, pss.get()), "done");
}

TEST(NewSignature, RefusesWeakKeys) {
  const auto weak = Loaded(Tests::MakeRsaKey(1024));
  EXPECT_EQ(SignRefusal(kRsaSha256, weak.get()),
            "security: The private RSA key has 1024 bits; at least 2048 are needed.");
  const auto uncommon = Loaded(Tests::MakeEcKey("secp256k1"));
  EXPECT_EQ(SignRefusal(kEcdsaSha256, uncommon.get()),
            "security: The private key is not on the curve P-256, P-384 or P-521.");
}

class StrangeKey final : public PrivateKey, public ObjectImpl {
 public:
  Ref<const Crypto::PublicKey> GetPublicKey() const override { return nullptr; }
  bool Matches(const Crypto::Certificate&) const override { return true; }
};

TEST(NewSignature, RefusesKeysOfOtherMakes) {
  EXPECT_EQ(SignRefusal(kRsaSha256, MakeRef<StrangeKey>().get()),
            "security: The private key was not made by this library.");
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

TEST(NewSignature, SignsOnP521AsWeVerify) {
  const OpenSsl::OwnedKey key = Tests::MakeEcKey("P-521");
  Tests::CertificateRecipe recipe;
  recipe.key = key.get();
  Request request(kExclusive, "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha512");
  request.Reference("#body");
  request.signature->Sign(Loaded(key).get());
  EXPECT_EQ(StringUtil::Base64Encode(std::vector<unsigned char>(132)).size(),
            Tests::Between(TextOf(request.signature->Element()), "<ds:SignatureValue>",
                           "</ds:SignatureValue>")
                .size());
  request.Place();
  EXPECT_TRUE(request.signature->Verify(
      CreateTrustedCertificatesResolver({Tests::MakeCertificate(recipe)}).get()));
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
