#include "support/assertion_text.h"

#include <algorithm>
#include <cstddef>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>

#include <devsts/certificates.h>
#include <devsts/xml_security.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "deployment.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::System::DateTime;

constexpr long kMicrosecondsPerSecond = 1'000'000;

std::string UpnNameId(const std::string& value) {
  return R"(<saml2:NameID Format="http://schemas.xmlsoap.org/claims/UPN">)" + value +
         "</saml2:NameID>";
}

std::string SubjectText(const DateTime& now) {
  return "<saml2:Subject>" + UpnNameId("alice@example.com") +
         R"(<saml2:SubjectConfirmation Method="urn:oasis:names:tc:SAML:2.0:cm:bearer">)"
         R"(<saml2:SubjectConfirmationData NotOnOrAfter=")" +
         TimeText(now, 3600) + R"("/></saml2:SubjectConfirmation></saml2:Subject>)";
}

std::string ConditionsText(const DateTime& now) {
  return R"(<saml2:Conditions NotBefore=")" + TimeText(now, -60) + R"(" NotOnOrAfter=")" +
         TimeText(now, 3600) +
         R"("><saml2:AudienceRestriction><saml2:Audience>https://b.example</saml2:Audience>)"
         R"(<saml2:Audience>https://a.example</saml2:Audience></saml2:AudienceRestriction>)"
         R"(<saml2:ProxyRestriction Count="10"/>)"
         R"(<saml2:Condition xsi:type="rsa:RenewRestrictionType" Count="5" Postdatable="false" )"
         R"(RenewExpired="true"/></saml2:Conditions>)";
}

std::string AdviceText() {
  return R"(<saml2:Advice><rsa:RSAAdvice AdviceSource="urn:source"><saml2:Attribute Name="urn:hint">)"
         R"(<saml2:AttributeValue xsi:type="xs:string">one</saml2:AttributeValue>)"
         R"(<saml2:AttributeValue>two</saml2:AttributeValue></saml2:Attribute>)"
         R"(</rsa:RSAAdvice></saml2:Advice>)";
}

std::string AuthnStatementText(const DateTime& now) {
  return R"(<saml2:AuthnStatement AuthnInstant=")" + TimeText(now, -60) +
         R"("><saml2:AuthnContext><saml2:AuthnContextClassRef>)"
         R"(urn:oasis:names:tc:SAML:2.0:ac:classes:PasswordProtectedTransport)"
         R"(</saml2:AuthnContextClassRef></saml2:AuthnContext></saml2:AuthnStatement>)";
}

std::string AttributeText(const std::string& name, const std::string& values) {
  return R"(<saml2:Attribute Name=")" + name + R"(">)" + values + "</saml2:Attribute>";
}

std::string ValueText(const std::string& value) {
  return R"(<saml2:AttributeValue xsi:type="xs:string">)" + value + "</saml2:AttributeValue>";
}

std::string AttributeStatementText() {
  const std::string claims = "http://schemas.xmlsoap.org/ws/2005/05/identity/claims/";
  return "<saml2:AttributeStatement>" +
         AttributeText(kGroupIdentityAttribute,
                       ValueText("EXAMPLE\\staff") + ValueText("EXAMPLE\\admins")) +
         AttributeText(kIsSolutionAttribute, ValueText("false")) +
         AttributeText(claims + "givenname", ValueText("Alice")) +
         AttributeText(claims + "surname", ValueText("Archer")) + "</saml2:AttributeStatement>";
}

DevSts::Credential MakeCredential() {
  DevSts::CertificateSpec spec;
  spec.commonName = "STS";
  spec.freshKey = true;
  return DevSts::MakeCertificate(spec);
}

}  // namespace

std::string NamespaceDeclarations() {
  return R"(xmlns:saml2="urn:oasis:names:tc:SAML:2.0:assertion" )"
         R"(xmlns:ds="http://www.w3.org/2000/09/xmldsig#" xmlns:rsa=")" +
         std::string(kVendorSamlNamespace) +
         R"(" xmlns:del="urn:oasis:names:tc:SAML:2.0:conditions:delegation" )"
         R"(xmlns:xs="http://www.w3.org/2001/XMLSchema" )"
         R"(xmlns:xsi="http://www.w3.org/2001/XMLSchema-instance")";
}

std::string Replaced(std::string text, std::string_view from, std::string_view to) {
  const std::size_t place = text.find(from);
  if (place == std::string::npos || text.find(from, place + 1) != std::string::npos) {
    throw std::logic_error("Not exactly once in the text: " + std::string(from));
  }
  return text.replace(place, from.size(), to);
}

std::string InsertedAfter(std::string text, std::string_view anchor, std::string_view addition) {
  return Replaced(std::move(text), anchor, std::string(anchor).append(addition));
}

std::string TimeText(const DateTime& now, long seconds) {
  return Tarnik::System::DateTimeFromUtc(now.GetUtcTime() + seconds * kMicrosecondsPerSecond, false)
      .ToString();
}

std::string MadeUpSignature(std::string_view referenceUri) {
  return R"(<ds:Signature xmlns:ds="http://www.w3.org/2000/09/xmldsig#"><ds:SignedInfo>)"
         R"(<ds:CanonicalizationMethod Algorithm="http://www.w3.org/2001/10/xml-exc-c14n#"/>)"
         R"(<ds:SignatureMethod Algorithm="http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256"/>)"
         R"(<ds:Reference URI=")" +
         std::string(referenceUri) +
         R"("><ds:Transforms>)"
         R"(<ds:Transform Algorithm="http://www.w3.org/2000/09/xmldsig#enveloped-signature"/>)"
         R"(<ds:Transform Algorithm="http://www.w3.org/2001/10/xml-exc-c14n#"/></ds:Transforms>)"
         R"(<ds:DigestMethod Algorithm="http://www.w3.org/2001/04/xmlenc#sha256"/>)"
         R"(<ds:DigestValue>AAECAwQFBgcICQoLDA0ODxAREhMUFRYXGBkaGxwdHh8=</ds:DigestValue>)"
         R"(</ds:Reference></ds:SignedInfo><ds:SignatureValue>AAECAwQF</ds:SignatureValue>)"
         R"(</ds:Signature>)";
}

AssertionText::AssertionText(const DateTime& now)
    : attributes(R"(ID="_a1" IssueInstant=")" + TimeText(now, -60) + R"(" Version="2.0")"),
      issuer(R"(<saml2:Issuer Format="urn:oasis:names:tc:SAML:2.0:nameid-format:entity">)"
             R"(https://sts.example.com/STS</saml2:Issuer>)"),
      signature(MadeUpSignature("#_a1")),
      subject(SubjectText(now)),
      conditions(ConditionsText(now)),
      advice(AdviceText()),
      authnStatement(AuthnStatementText(now)),
      attributeStatement(AttributeStatementText()) {}

AssertionText& AssertionText::Delegate() {
  subject = Replaced(std::move(subject), "cm:bearer\">",
                     "cm:bearer\">" + UpnNameId("second@example.com"));
  conditions = Replaced(
      std::move(conditions), "</saml2:Conditions>",
      R"(<saml2:Condition xsi:type="del:DelegationRestrictionType">)"
      R"(<del:Delegate DelegationInstant="2024-03-05T07:08:09.010Z">)" +
          UpnNameId("first@example.com") +
          R"(</del:Delegate><del:Delegate DelegationInstant="2024-03-05T07:08:10Z">)" +
          UpnNameId("second@example.com") + "</del:Delegate></saml2:Condition></saml2:Conditions>");
  return *this;
}

AssertionText& AssertionText::ConfirmByKey(const std::string& certificatePem) {
  subject = Replaced(std::move(subject), "cm:bearer", "cm:holder-of-key");
  subject = Replaced(std::move(subject), "<saml2:SubjectConfirmationData ",
                     R"(<saml2:SubjectConfirmationData )"
                     R"(xsi:type="saml2:KeyInfoConfirmationDataType" )");
  subject =
      Replaced(std::move(subject), "/></saml2:SubjectConfirmation>",
               "><ds:KeyInfo><ds:X509Data><ds:X509Certificate>" + CertificateBody(certificatePem) +
                   "</ds:X509Certificate></ds:X509Data></ds:KeyInfo>"
                   "</saml2:SubjectConfirmationData></saml2:SubjectConfirmation>");
  return *this;
}

std::string AssertionText::ToXml() const {
  return "<saml2:Assertion " + NamespaceDeclarations() + " " + attributes + ">" + issuer +
         signature + subject + conditions + advice + authnStatement + attributeStatement + tail +
         "</saml2:Assertion>";
}

std::string AssertionText::ToSignedXml(const DevSts::Credential& credential,
                                       DevSts::SignOptions options) const {
  options.signature = DevSts::SignatureAlgorithm::EcdsaSha256;
  AssertionText unsignedText = *this;
  unsignedText.signature.clear();
  return DevSts::SignXml(unsignedText.ToXml(), credential.privateKeyPem, credential.certificatePem,
                         options);
}

std::string CertificateBody(const std::string& certificatePem) {
  std::string body;
  std::size_t start = 0;
  while (start < certificatePem.size()) {
    const std::size_t end = std::min(certificatePem.find('\n', start), certificatePem.size());
    const std::string line = certificatePem.substr(start, end - start);
    if (line.rfind("-----", 0) != 0) {
      body += line;
    }
    start = end + 1;
  }
  return body;
}

const DevSts::Credential& TrustedCredential() {
  static const DevSts::Credential credential = MakeCredential();
  return credential;
}

const DevSts::Credential& StrangerCredential() {
  static const DevSts::Credential credential = MakeCredential();
  return credential;
}

Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> TrustedResolver() {
  return Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::CreateCertificatesFromPem(TrustedCredential().certificatePem));
}

}  // namespace SsoClient::Testing
