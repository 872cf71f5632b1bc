#include "xml/security_header.h"

#include <tarnik/system/date_time.h>
#include <tarnik/text/base64.h>

#include "support/namespaces.h"
#include "xml/xml_date_time.h"

namespace SsoClient {

namespace {

constexpr char kPasswordTextType[] =
    "http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-username-token-profile-1.0#PasswordText";

// "tokenprofile" and "token-profile" are the profile's own spellings.
constexpr char kSamlTokenType[] =
    "http://docs.oasis-open.org/wss/oasis-wss-saml-tokenprofile-1.1#SAMLV2.0";
constexpr char kSamlIdValueType[] =
    "http://docs.oasis-open.org/wss/oasis-wss-saml-token-profile-1.1#SAMLID";

std::string Base64Text(const Tarnik::Crypto::Certificate& certificate) {
  const unsigned char* bytes = certificate.DerBytes();
  const std::size_t length = certificate.DerLength();
  std::string text(Tarnik::Base64_EncodedLength(bytes, length), '\0');
  std::size_t written = 0;
  Tarnik::Base64_Encode(bytes, length, text.data(), text.size(), &written);
  text.resize(written);
  return text;
}

}  // namespace

std::shared_ptr<XMLCompositeBuilder> BuildSecurityHeader(std::uint32_t minutes) {
  const auto now = Tarnik::System::GetUtcDateTime();
  auto timestamp = MakeCompositeBuilder("wsu", "Timestamp", {{"xmlns:wsu", kWsuNamespace}});
  AddCreatedAndExpires(*timestamp, now, AddMinutes(now, minutes));
  auto security = MakeCompositeBuilder("wsse", "Security", {{"xmlns:wsse", kWsseNamespace}});
  security->Add(timestamp);
  return security;
}

std::shared_ptr<XMLCompositeBuilder> BuildUsernameToken(std::string_view user) {
  auto token = MakeCompositeBuilder("wsse", "UsernameToken", {{"xmlns:wsse", kWsseNamespace}});
  token->Add(MakeTextElementBuilder("wsse", "Username", user));
  return token;
}

std::shared_ptr<XMLCompositeBuilder> BuildUsernamePasswordToken(std::string_view user,
                                                                std::string_view password) {
  auto token = BuildUsernameToken(user);
  token->Add(MakeTextElementBuilder("wsse", "Password", password, {{"Type", kPasswordTextType}}));
  return token;
}

std::shared_ptr<XMLBaseBuilder> BuildBinarySecurityToken(
    const std::string& id, const Tarnik::Crypto::Certificate& certificate) {
  return MakeTextElementBuilder("wsse", "BinarySecurityToken", Base64Text(certificate),
                                {{"EncodingType", kBase64BinaryEncoding},
                                 {"ValueType", kX509TokenType},
                                 {"wsu:Id", id},
                                 {"xmlns:wsu", kWsuNamespace}});
}

std::shared_ptr<XMLCompositeBuilder> BuildSamlTokenReference(std::string_view assertionId) {
  auto reference = MakeCompositeBuilder("wsse", "SecurityTokenReference",
                                        {{"wsse11:TokenType", kSamlTokenType},
                                         {"xmlns:wsse", kWsseNamespace},
                                         {"xmlns:wsse11", kWsse11Namespace}});
  reference->Add(MakeTextElementBuilder("wsse", "KeyIdentifier", assertionId,
                                        {{"ValueType", kSamlIdValueType}}));
  return reference;
}

std::shared_ptr<XMLCompositeBuilder> BuildCertificateReference() {
  auto reference =
      MakeCompositeBuilder("wsse", "SecurityTokenReference", {{"xmlns:wsse", kWsseNamespace}});
  reference->Add(MakeElementBuilder(
      "wsse", "Reference",
      {{"URI", std::string("#") + kCertificateId}, {"ValueType", kX509TokenType}}));
  return reference;
}

}  // namespace SsoClient
