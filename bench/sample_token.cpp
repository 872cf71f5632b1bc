#include "sample_token.h"

#include <map>

#include <devsts/certificates.h>
#include <devsts/xml_security.h>
#include <tarnik/system/date_time.h>

namespace Bench {
namespace {

// The length that the signature and its certificate add to the text.
constexpr std::size_t kSignatureSize = 2200;

std::string TimeText(long secondsFromNow) {
  const long now = Tarnik::System::GetUtcDateTime().GetUtcTime();
  return Tarnik::System::DateTimeFromUtc(now + secondsFromNow * 1'000'000, false).ToString();
}

std::string GroupValues(std::size_t size) {
  std::string values;
  for (int group = 0; values.size() < size; ++group) {
    values += "<saml2:AttributeValue xsi:type=\"xs:string\">EXAMPLE\\group-" +
              std::to_string(10000 + group) + "</saml2:AttributeValue>";
  }
  return values;
}

std::string AssertionText(std::size_t groupsSize) {
  const std::string begin = TimeText(-60);
  const std::string end = TimeText(24L * 3600);
  return "<saml2:Assertion xmlns:saml2=\"urn:oasis:names:tc:SAML:2.0:assertion\" "
         "xmlns:xs=\"http://www.w3.org/2001/XMLSchema\" "
         "xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\" "
         "ID=\"_0b3c1a52-9f6e-4a53-8a57-3f6e2f5d1c11\" IssueInstant=\"" +
         begin +
         "\" Version=\"2.0\"><saml2:Issuer>https://sts.example/STS</saml2:Issuer>"
         "<saml2:Subject>"
         "<saml2:NameID "
         "Format=\"http://schemas.xmlsoap.org/claims/UPN\">alice@example.com</saml2:NameID>"
         "<saml2:SubjectConfirmation Method=\"urn:oasis:names:tc:SAML:2.0:cm:bearer\">"
         "<saml2:SubjectConfirmationData NotOnOrAfter=\"" +
         end +
         "\"/></saml2:SubjectConfirmation></saml2:Subject>"
         "<saml2:Conditions NotBefore=\"" +
         begin + "\" NotOnOrAfter=\"" + end +
         "\"><saml2:ProxyRestriction Count=\"10\"/></saml2:Conditions>"
         "<saml2:AuthnStatement AuthnInstant=\"" +
         begin +
         "\"><saml2:AuthnContext><saml2:AuthnContextClassRef>"
         "urn:oasis:names:tc:SAML:2.0:ac:classes:PasswordProtectedTransport"
         "</saml2:AuthnContextClassRef></saml2:AuthnContext></saml2:AuthnStatement>"
         "<saml2:AttributeStatement><saml2:Attribute "
         "Name=\"http://sts-vendor.example/schemas/attr-names/2009/01/GroupIdentity\">" +
         GroupValues(groupsSize) +
         "</saml2:Attribute></saml2:AttributeStatement></saml2:Assertion>";
}

SampleToken MakeToken(std::size_t size) {
  DevSts::CertificateSpec spec;
  spec.commonName = "STS signing";
  spec.keyType = DevSts::KeyType::Rsa2048;
  static const DevSts::Credential credential = DevSts::MakeCertificate(spec);
  const std::size_t fixed = AssertionText(0).size() + kSignatureSize;
  const std::string text = AssertionText(size > fixed ? size - fixed : 0);
  DevSts::SignOptions options;
  options.inclusivePrefixes = {"xs"};
  if (size < fixed) {
    options.keyInfo = DevSts::KeyInfoContent::None;
  }
  return {DevSts::SignXml(text, credential.privateKeyPem, credential.certificatePem, options),
          credential.certificatePem};
}

}  // namespace

const SampleToken& GetSampleToken(std::size_t size) {
  static std::map<std::size_t, SampleToken> tokens;
  const auto found = tokens.find(size);
  return found != tokens.end() ? found->second
                               : tokens.emplace(size, MakeToken(size)).first->second;
}

}  // namespace Bench
