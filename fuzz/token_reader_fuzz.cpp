// Reading a token returns a token or throws one of the documented exceptions. A token keeps its
// text, and its canonical text is a token with the same values.
#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/xml/security/xml_security_exception.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "input.h"
#include "support/libxml2_oracle.h"
#include "support/token_values.h"
#include "xml_input.h"

namespace {

// Long enough for the dates of all seeds, however they are mutated.
constexpr long kTolerance = 300'000'000'000;

std::shared_ptr<const SsoClient::SamlToken> Read(const std::string& text) {
  try {
    return SsoClient::CreateSamlToken(text, kTolerance);
  } catch (const SsoClient::ParseException&) {
  } catch (const Tarnik::Xml::XMLParseException&) {
  } catch (const Tarnik::Base64FormatException&) {
  } catch (const Tarnik::Crypto::CryptoException&) {
  }
  return nullptr;
}

std::shared_ptr<const SsoClient::SamlToken> ReadTree(const std::string& text) {
  const auto document = Fuzz::ParseXml(text);
  try {
    return SsoClient::CreateSamlTokenFromDom(document->RootElement(), kTolerance);
  } catch (const Tarnik::Xml::Security::XmlSecurityException&) {
    // There is no canonical text with a relative namespace URI.
    return nullptr;
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text = Fuzz::TextOf(data, size);
  const auto token = Read(text);
  if (token == nullptr) {
    return 0;
  }
  Fuzz::Require(token->Xml() == text);
  const std::string values = SsoClient::Testing::AllValues(*token);
  if (!Fuzz::HasOddNamespace(*Fuzz::ParseXml(text))) {
    Fuzz::Require(Tarnik::Testing::IsWellFormedForLibXml2(text));
  }
  const auto fromTree = ReadTree(text);
  if (fromTree == nullptr) {
    return 0;
  }
  Fuzz::Require(SsoClient::Testing::AllValues(*fromTree) == values);
  const auto canonical = Read(fromTree->Xml());
  Fuzz::Require(canonical != nullptr && SsoClient::Testing::AllValues(*canonical) == values);
  Fuzz::Require(ReadTree(fromTree->Xml())->Xml() == fromTree->Xml());
  return 0;
}
