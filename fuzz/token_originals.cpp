#include "token_originals.h"

#include <tarnik/crypto/certificate.h>

#include "support/assertion_text.h"

namespace Fuzz {
namespace {

using DevSts::KeyType;
using DevSts::SignatureAlgorithm;
using SsoClient::Testing::AssertionText;
using SsoClient::Testing::Replaced;

constexpr const char* kAudiences =
    "<saml2:AudienceRestriction><saml2:Audience>https://b.example</saml2:Audience>"
    "<saml2:Audience>https://a.example</saml2:Audience></saml2:AudienceRestriction>";
constexpr const char* kProxy = R"(<saml2:ProxyRestriction Count="10"/>)";
constexpr const char* kRenew =
    R"(<saml2:Condition xsi:type="rsa:RenewRestrictionType" Count="5" Postdatable="false" )"
    R"(RenewExpired="true"/>)";

DevSts::Credential MakeCredential(KeyType keyType) {
  DevSts::CertificateSpec spec;
  spec.commonName = "Signer";
  spec.keyType = keyType;
  return DevSts::MakeCertificate(spec);
}

Signer MakeSigner(KeyType keyType, SignatureAlgorithm algorithm) {
  const DevSts::Credential credential = MakeCredential(keyType);
  return {credential, algorithm,
          Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
              Tarnik::Crypto::CreateCertificatesFromPem(credential.certificatePem))};
}

std::string TextOf(AssertionText parts) {
  parts.signature.clear();
  return parts.ToXml();
}

// The assertion with only some of its restrictions.
AssertionText Restricted(bool hasAudiences, bool hasProxy, bool hasRenew) {
  AssertionText text;
  if (!hasAudiences) {
    text.conditions = Replaced(text.conditions, kAudiences, "");
  }
  if (!hasProxy) {
    text.conditions = Replaced(text.conditions, kProxy, "");
  }
  if (!hasRenew) {
    text.conditions = Replaced(text.conditions, kRenew, "");
  }
  return text;
}

// With what canonical texts may leave out or write in another way.
std::string MixedText() {
  AssertionText text = Restricted(true, true, true).Delegate();
  text.conditions += "\r\n\t<!-- a comment -->&#10;";
  return TextOf(text);
}

std::string BareText() {
  AssertionText text = Restricted(false, false, false);
  text.advice.clear();
  text.authnStatement.clear();
  text.attributeStatement.clear();
  return TextOf(text);
}

}  // namespace

const std::vector<Signer>& Signers() {
  static const std::vector<Signer> signers{
      MakeSigner(KeyType::EcP256, SignatureAlgorithm::EcdsaSha256),
      MakeSigner(KeyType::EcP384, SignatureAlgorithm::EcdsaSha384),
      MakeSigner(KeyType::Rsa2048, SignatureAlgorithm::RsaSha256),
      MakeSigner(KeyType::Rsa2048, SignatureAlgorithm::RsaPssSha256),
      MakeSigner(KeyType::Rsa2048, SignatureAlgorithm::RsaPssSha512)};
  return signers;
}

const std::vector<std::string>& Layouts() {
  static const std::string holder = MakeCredential(KeyType::EcP256).certificatePem;
  static const std::vector<std::string> layouts{
      TextOf(AssertionText()),
      BareText(),
      TextOf(Restricted(false, false, true)),
      TextOf(Restricted(false, true, false)),
      TextOf(Restricted(false, false, false).Delegate()),
      MixedText(),
      TextOf(AssertionText().ConfirmByKey(holder)),
      TextOf(AssertionText().Delegate().ConfirmByKey(holder))};
  return layouts;
}

const std::vector<Flaw>& Flaws() {
  static const std::vector<Flaw> flaws{
      {R"(Version="2.0")", R"(Version="2.1")"},
      {R"(Version="2.0")", R"(Version="2.0 ")"},
      {R"(ID="_a1")", R"(ID="a1")"},
      {R"(IssueInstant="20)", R"(IssueInstant="0020)"},
      {"<saml2:Subject>", R"(<saml2:Subject Version="2.0">)"},
      {"<saml2:Issuer ", R"(<saml2:Issuer NameQualifier="q" )"},
      {"<saml2:Conditions ", R"(<saml2:Conditions Count="1" )"},
      {"<saml2:SubjectConfirmationData ", R"(<saml2:SubjectConfirmationData Recipient="r" )"},
      {R"(Name="urn:hint")", R"(Name="urn:hint" OriginalIssuer="o")"},
      {"<saml2:AuthnStatement ", R"(<saml2:AuthnStatement SessionIndex="1" )"},
      {"</saml2:SubjectConfirmation>", "<saml2:SubjectLocality/></saml2:SubjectConfirmation>"},
      {"</saml2:Subject>", "<saml2:SubjectConfirmation/></saml2:Subject>"},
      {"</saml2:Conditions>", "<saml2:OneTimeUse/></saml2:Conditions>"},
      {"</saml2:Advice>", "<saml2:AssertionIDRef>_b</saml2:AssertionIDRef></saml2:Advice>"},
      {"</saml2:AuthnContext>", "<saml2:SubjectLocality/></saml2:AuthnContext>"},
      {"</saml2:AttributeStatement>", "</saml2:AttributeStatement><saml2:AttributeStatement/>"},
      {kProxy, R"(<saml2:ProxyRestriction Count="10"/><saml2:ProxyRestriction Count="10"/>)"},
      {R"(Count="10")", R"(Count="-10")"},
      {R"(Count="5")", R"(Count="4294967296")"},
      {R"(Postdatable="false")", R"(Postdatable="no")"},
      {"</saml2:NameID></del:Delegate></saml2:Condition>",
       "x</saml2:NameID></del:Delegate></saml2:Condition>"},
      {"alice@example.com", "alice"},
      {"alice@example.com", "alice@"},
      {R"(EXAMPLE\staff)", R"(\staff)"},
      {">false</saml2:AttributeValue>",
       ">false</saml2:AttributeValue><saml2:AttributeValue>true</saml2:AttributeValue>"},
      {"<saml2:SubjectConfirmationData NotOnOrAfter=\"20",
       "<saml2:SubjectConfirmationData NotOnOrAfter=\"19"},
      {"cm:bearer", "cm:sender-vouches"},
      {"alice@example.com", "alice@example<!-- -->.com"}};
  return flaws;
}

std::string WithFlaw(std::string text, const Flaw& flaw) {
  const std::string from = flaw.from;
  const std::size_t place = text.find(from);
  return place == std::string::npos ? text : text.replace(place, from.size(), flaw.to);
}

}  // namespace Fuzz
