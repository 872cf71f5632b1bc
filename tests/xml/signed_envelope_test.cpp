#include "xml/signed_envelope.h"

#include <cstddef>
#include <initializer_list>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include <gmock/gmock.h>

#include <devsts/certificates.h>
#include <devsts/xml_security.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "support/holder_of_key.h"
#include "support/namespaces.h"
#include "support/parse_xml.h"
#include "support/thrown_message.h"
#include "xml/builders.h"
#include "xml/built_xml.h"
#include "xml/security_header.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Ref;
using Tarnik::Xml::ElementNode;
using testing::ElementsAre;

constexpr char kEnvelopeStart[] =
    "<soapenv:Envelope xmlns:soapenv=\"http://schemas.xmlsoap.org/soap/envelope/\">";
constexpr char kBodyStart[] =
    "<soapenv:Body xmlns:wst=\"http://docs.oasis-open.org/ws-sx/ws-trust/200512\">";

TEST(EnvelopeTest, HoldsHeaderThenBody) {
  const auto envelope = BuildEnvelope(MakeElementBuilder("", "H"), MakeElementBuilder("", "B"));
  EXPECT_EQ(BuiltXml(*envelope), std::string(kEnvelopeStart) +
                                     "<soapenv:Header><H/></soapenv:Header>" + kBodyStart +
                                     "<B/></soapenv:Body></soapenv:Envelope>");
}

TEST(EnvelopeTest, AnEmptyHeaderIsSentEmpty) {
  const auto envelope = BuildEnvelope(nullptr, MakeElementBuilder("", "B"));
  EXPECT_EQ(BuiltXml(*envelope), std::string(kEnvelopeStart) + "<soapenv:Header/>" + kBodyStart +
                                     "<B/></soapenv:Body></soapenv:Envelope>");
}

TEST(EnvelopeTest, DeclaresWstForBodiesThatDoNot) {
  const auto envelope = Built(*BuildEnvelope(nullptr, MakeElementBuilder("wst", "Response")));
  const auto* response = envelope->FirstChildElement("Body")->FirstChildElement("Response");
  EXPECT_EQ(response->NamespaceUri(), "http://docs.oasis-open.org/ws-sx/ws-trust/200512");
}

std::string ErrorMessage(const std::string& xml) {
  const auto document = ParseXml(xml);
  return ThrownMessage<Tarnik::InvalidArgumentException>(
      [&] { RejectReservedIds(*document->RootElement()); });
}

TEST(OwnIdsTest, AcceptsOtherIdsAndOneCertificate) {
  const std::string accepted = "Nothing was thrown.";
  EXPECT_EQ(ErrorMessage("<a Id=\"1\"><b Id=\"1\">text</b><!-- --><c/></a>"), accepted);
  EXPECT_EQ(ErrorMessage("<a><b><c Id=\"holderOfKeyCertificate\"/></b></a>"), accepted);
  EXPECT_EQ(ErrorMessage("<a Name=\"holderOfKeyProofSignature\">holderOfKeyProofSignature</a>"),
            accepted);
  for (const char* value : {"holderofkeyproofsignature", "holderOfKeyProofSignature2",
                            "holderOf KeyProofSignature", "#holderOfKeyProofSignature"}) {
    EXPECT_EQ(ErrorMessage("<a Id=\"" + std::string(value) + "\"/>"), accepted) << value;
  }
  EXPECT_EQ(ErrorMessage("<a identity=\"holderOfKeyProofSignature\"/>"), accepted);
}

TEST(OwnIdsTest, ExaminesOnlyTheElementThatIsGiven) {
  const auto document = ParseXml(
      "<r Id=\"holderOfKeyProofSignature\"><a><b/></a><c Id=\"holderOfKeyProofSignature\"/></r>");
  EXPECT_NO_THROW(RejectReservedIds(*FindElement(document->RootElement(), "a")));
  EXPECT_THROW(RejectReservedIds(*FindElement(document->RootElement(), "c")),
               Tarnik::InvalidArgumentException);
}

TEST(OwnIdsTest, RefusesTheSignatureIdAnywhere) {
  const std::string refused =
      "A token in the request carries the id 'holderOfKeyProofSignature', which is the request's "
      "own";
  for (const char* element :
       {"<c Id=\"holderOfKeyProofSignature\"/>", "<c ID=\"holderOfKeyProofSignature\"/>",
        "<c id=\"holderOfKeyProofSignature\"/>", "<c xml:id=\"holderOfKeyProofSignature\"/>",
        "<c iD=\"holderOfKeyProofSignature\"/>", "<c Id=\" holderOfKeyProofSignature\"/>",
        "<c ID=\"&#10;holderOfKeyProofSignature&#9; \"/>",
        "<c xmlns:p=\"urn:p\" p:iD=\"holderOfKeyProofSignature \"/>",
        "<c xmlns:p=\"urn:p\" a=\"b\" p:Id=\"holderOfKeyProofSignature\"/>"}) {
    EXPECT_EQ(ErrorMessage(element), refused) << element;
    EXPECT_EQ(ErrorMessage("<a>text<b/><b><d/>" + std::string(element) + "</b></a>"), refused)
        << element;
    EXPECT_EQ(ErrorMessage("<a><b><d/></b>" + std::string(element) + "</a>"), refused) << element;
  }
}

TEST(OwnIdsTest, RefusesASecondCertificateId) {
  EXPECT_EQ(
      ErrorMessage("<a><b Id=\"holderOfKeyCertificate\"/><c><d id=\"holderOfKeyCertificate\"/>"
                   "</c></a>"),
      "A token in the request carries the id 'holderOfKeyCertificate', which is the "
      "request's own");
  EXPECT_EQ(
      ErrorMessage("<a><b Id=\"holderOfKeyCertificate\"/><c iD=\" holderOfKeyCertificate\"/></a>"),
      "A token in the request carries the id 'holderOfKeyCertificate', which is the "
      "request's own");
}

const DevSts::Credential& Credential() {
  static const DevSts::Credential credential = KeyCredential();
  return credential;
}

std::shared_ptr<XMLBaseBuilder> Body() {
  return MakeTextElementBuilder("", "Body", "text");
}

std::shared_ptr<XMLSignedSoapBuilder> CertificateForm() {
  const auto config = ConfigOf(Credential());
  return MakeSignedSoapBuilderForCertificate(BuildSecurityHeader(10), Body(), config.privateKey,
                                             *config.certificate);
}

const ElementNode& At(const ElementNode& root, std::initializer_list<std::string_view> path) {
  const ElementNode* current = &root;
  for (const auto name : path) {
    current = current->FirstChildElement(name);
    if (current == nullptr) {
      throw std::runtime_error("no element " + std::string(name));
    }
  }
  return *current;
}

std::vector<std::string> ChildNames(const ElementNode& element) {
  std::vector<std::string> names;
  for (auto* node = element.FirstChild(); node != nullptr; node = node->NextSibling()) {
    names.emplace_back(static_cast<const ElementNode*>(node)->QualifiedNameText());
  }
  return names;
}

std::vector<std::string> AttributeNames(const ElementNode& element) {
  std::vector<std::string> names;
  for (std::size_t i = 0; i < element.AttributeCount(); ++i) {
    names.emplace_back(element.AttributeAt(i).Name());
  }
  return names;
}

std::string IdOf(const ElementNode& element) {
  return std::string(element.FindAttribute(kWsuNamespace, "Id").value_or("none"));
}

Ref<Tarnik::Xml::Security::Signature> SignatureOf(const ElementNode& envelope) {
  return Tarnik::Xml::Security::CreateSignatureFromDom(
      At(envelope, {"Header", "Security"}).FirstChildElement("Signature"));
}

/// The whole content of ds:KeyInfo.
std::string KeyInfoText(const ElementNode& envelope) {
  std::string text;
  const auto& keyInfo = At(envelope, {"Header", "Security", "Signature", "KeyInfo"});
  for (auto* node = keyInfo.FirstChild(); node != nullptr; node = node->NextSibling()) {
    text += XmlText(node);
  }
  return text;
}

TEST(XMLSignedSoapBuilderTest, SignsTheBodyAndThenTheTimestamp) {
  const auto envelope = Built(*CertificateForm());
  const auto signature = SignatureOf(*envelope);
  EXPECT_EQ(signature->SignatureMethod(), "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256");
  EXPECT_EQ(signature->CanonicalizationMethod(), "http://www.w3.org/2001/10/xml-exc-c14n#");
  ASSERT_EQ(signature->References().size(), 2U);
  EXPECT_EQ(signature->References()[0].uri, "#" + IdOf(At(*envelope, {"Body"})));
  EXPECT_EQ(signature->References()[1].uri,
            "#" + IdOf(At(*envelope, {"Header", "Security", "Timestamp"})));
  for (const auto& reference : signature->References()) {
    EXPECT_EQ(reference.digestMethod, "http://www.w3.org/2001/04/xmlenc#sha256");
    EXPECT_THAT(reference.transforms, ElementsAre("http://www.w3.org/2001/10/xml-exc-c14n#"));
  }
}

TEST(XMLSignedSoapBuilderTest, AnotherImplementationVerifiesTheWrittenRequest) {
  const auto text = BuiltXml(*CertificateForm());
  const auto verdict = DevSts::VerifyXml(text, Credential().certificatePem);
  EXPECT_TRUE(verdict.valid) << verdict.reason;
  auto changed = text;
  changed.replace(changed.find(">text<"), 6, ">next<");
  EXPECT_FALSE(DevSts::VerifyXml(changed, Credential().certificatePem).valid);
}

TEST(XMLSignedSoapBuilderTest, TheSignatureIsLastInTheHeaderAndHasItsId) {
  const auto envelope = Built(*CertificateForm());
  const auto& security = At(*envelope, {"Header", "Security"});
  EXPECT_THAT(ChildNames(security),
              ElementsAre("wsu:Timestamp", "wsse:BinarySecurityToken", "ds:Signature"));
  EXPECT_EQ(At(security, {"Signature"}).FindAttribute("Id"), "holderOfKeyProofSignature");
}

TEST(XMLSignedSoapBuilderTest, TheCertificateFormRefersToTheCertificateInTheHeader) {
  const auto envelope = Built(*CertificateForm());
  EXPECT_EQ(XmlText(&At(*envelope, {"Header", "Security", "BinarySecurityToken"})),
            BuiltXml(*BuildBinarySecurityToken("holderOfKeyCertificate",
                                               *ConfigOf(Credential()).certificate)));
  EXPECT_EQ(KeyInfoText(*envelope),
            "<wsse:SecurityTokenReference xmlns:wsse=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-wssecurity-secext-1.0.xsd\">"
            "<wsse:Reference URI=\"#holderOfKeyCertificate\""
            " ValueType=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-x509-token-profile-1.0#X509v3\"/></wsse:SecurityTokenReference>");
}

TEST(XMLSignedSoapBuilderTest, TheCertificateFormLeavesTheGivenHeaderUnchanged) {
  const auto header = BuildSecurityHeader(10);
  const auto config = ConfigOf(Credential());
  const auto builder =
      MakeSignedSoapBuilderForCertificate(header, Body(), config.privateKey, *config.certificate);
  Built(*builder);
  EXPECT_THAT(ChildNames(*Built(*header)), ElementsAre("wsu:Timestamp"));
}

TEST(XMLSignedSoapBuilderTest, TheTokenFormRefersToTheAssertion) {
  const auto header = BuildSecurityHeader(10);
  header->Add(MakeElementBuilder("", "Assertion", {{"ID", "_1"}}));
  const auto config = ConfigOf(Credential());
  const auto envelope =
      Built(*MakeSignedSoapBuilderForToken(header, Body(), config.privateKey, "_1"));
  EXPECT_THAT(ChildNames(At(*envelope, {"Header", "Security"})),
              ElementsAre("wsu:Timestamp", "Assertion", "ds:Signature"));
  EXPECT_EQ(KeyInfoText(*envelope), BuiltXml(*BuildSamlTokenReference("_1")));
  const auto verdict = DevSts::VerifyXml(XmlText(envelope.get()), Credential().certificatePem);
  EXPECT_TRUE(verdict.valid) << verdict.reason;
}

TEST(XMLSignedSoapBuilderTest, NewIdsAreTheLocalNameAndAUuid) {
  const auto envelope = Built(*CertificateForm());
  const auto& timestamp = At(*envelope, {"Header", "Security", "Timestamp"});
  EXPECT_THAT(IdOf(At(*envelope, {"Body"})), testing::MatchesRegex("Body[0-9a-f-]{36}"));
  EXPECT_THAT(IdOf(timestamp), testing::MatchesRegex("Timestamp[0-9a-f-]{36}"));
  // An existing declaration is not repeated.
  EXPECT_THAT(AttributeNames(timestamp), ElementsAre("xmlns:wsu", "wsu:Id"));
  EXPECT_THAT(AttributeNames(At(*envelope, {"Body"})),
              ElementsAre("xmlns:wst", "xmlns:wsu", "wsu:Id"));
}

TEST(XMLSignedSoapBuilderTest, AnElementKeepsTheIdThatItHas) {
  auto security = MakeCompositeBuilder("wsse", "Security", {{"xmlns:wsse", kWsseNamespace}});
  security->Add(
      MakeElementBuilder("u", "Timestamp", {{"u:Id", "mine"}, {"xmlns:u", kWsuNamespace}}));
  const XMLSignedSoapBuilder builder(security, Body(), ConfigOf(Credential()).privateKey, nullptr);
  const auto envelope = Built(builder);
  const auto& timestamp = At(*envelope, {"Header", "Security", "Timestamp"});
  EXPECT_EQ(timestamp.AttributeCount(), 2U);
  EXPECT_EQ(SignatureOf(*envelope)->References()[1].uri, "#mine");
}

TEST(XMLSignedSoapBuilderTest, FindsTheTimestampAndItsIdByNamespace) {
  auto security = MakeCompositeBuilder("s", "Security", {{"xmlns:s", kWsseNamespace}});
  security->Add(MakeElementBuilder("x", "Timestamp", {{"x:Id", "x"}, {"xmlns:x", "urn:other"}}))
      .Add(MakeElementBuilder(
          "u", "Timestamp",
          {{"Id", "plain"}, {"x:Id", "x"}, {"xmlns:u", kWsuNamespace}, {"xmlns:x", "urn:other"}}));
  const XMLSignedSoapBuilder builder(security, Body(), ConfigOf(Credential()).privateKey, nullptr);
  const auto envelope = Built(builder);
  const auto& header = At(*envelope, {"Header", "Security"});
  EXPECT_EQ(XmlText(header.FirstChild()), "<x:Timestamp x:Id=\"x\" xmlns:x=\"urn:other\"/>");
  const auto& timestamp = *header.FirstChildElement(kWsuNamespace, "Timestamp");
  EXPECT_THAT(AttributeNames(timestamp),
              ElementsAre("Id", "x:Id", "xmlns:u", "xmlns:x", "xmlns:wsu", "wsu:Id"));
  EXPECT_THAT(IdOf(timestamp), testing::MatchesRegex("Timestamp[0-9a-f-]{36}"));
  EXPECT_EQ(SignatureOf(*envelope)->References()[1].uri, "#" + IdOf(timestamp));
}

TEST(XMLSignedSoapBuilderTest, WithoutAKeyInfoBuilderThereIsNoKeyInfo) {
  const XMLSignedSoapBuilder builder(BuildSecurityHeader(10), Body(),
                                     ConfigOf(Credential()).privateKey, nullptr);
  const auto envelope = Built(builder);
  EXPECT_EQ(At(*envelope, {"Header", "Security", "Signature"}).FirstChildElement("KeyInfo"),
            nullptr);
}

TEST(XMLSignedSoapBuilderTest, TwoBuildsDifferInIdsAndSignaturesAndBothVerify) {
  const auto builder = CertificateForm();
  const auto first = Built(*builder);
  const auto second = Built(*builder);
  EXPECT_NE(IdOf(At(*first, {"Body"})), IdOf(At(*second, {"Body"})));
  EXPECT_NE(IdOf(At(*first, {"Header", "Security", "Timestamp"})),
            IdOf(At(*second, {"Header", "Security", "Timestamp"})));
  const auto value = [](const ElementNode& envelope) {
    return XmlText(&At(envelope, {"Header", "Security", "Signature", "SignatureValue"}));
  };
  EXPECT_NE(value(*first), value(*second));
  for (const auto& envelope : {first, second}) {
    const auto verdict = DevSts::VerifyXml(XmlText(envelope.get()), Credential().certificatePem);
    EXPECT_TRUE(verdict.valid) << verdict.reason;
  }
}

TEST(XMLSignedSoapBuilderTest, AKeyThatCannotSignLeavesAnEnvelopeWithoutASignature) {
  const auto config = ConfigOf(KeyCredential(DevSts::KeyType::EcP256));
  Ref<ElementNode> envelope;
  EXPECT_THROW(MakeSignedSoapBuilderForCertificate(BuildSecurityHeader(10), Body(),
                                                   config.privateKey, *config.certificate)
                   ->Build(envelope),
               Tarnik::Xml::Security::XmlSecurityException);
  ASSERT_NE(envelope, nullptr);
  EXPECT_EQ(At(*envelope, {"Header", "Security"}).FirstChildElement("Signature"), nullptr);
}

}  // namespace
}  // namespace SsoClient::Testing
