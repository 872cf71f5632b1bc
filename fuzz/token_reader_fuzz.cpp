// Reading a token returns a token or throws one of the documented exceptions. It returns one
// exactly when the model reads one, with the same values, and the validity period includes the
// current time. A token keeps its text, and its canonical text is a token with the same values.
#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/xml/security/xml_security_exception.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "input.h"
#include "support/token_values.h"
#include "token_comparison.h"
#include "xml_input.h"
#include "xml_mutator.h"

namespace {

// Long enough for the dates of all seeds, however they are mutated.
constexpr long kTolerance = 300'000'000'000;
constexpr long kSecond = 1'000'000;

long Now() {
  return Tarnik::System::GetUtcDateTime().GetUtcTime();
}

std::shared_ptr<const SsoClient::SamlToken> Read(const std::string& text,
                                                 long tolerance = kTolerance) {
  try {
    return SsoClient::CreateSamlToken(text, tolerance);
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

void RequireSameFromTree(const std::string& text, const SsoClient::SamlToken& token) {
  Fuzz::Require(token.Xml() == text);
  const std::string values = SsoClient::Testing::AllValues(token);
  const auto fromTree = ReadTree(text);
  if (fromTree == nullptr) {
    return;
  }
  Fuzz::Require(SsoClient::Testing::AllValues(*fromTree) == values);
  const auto canonical = Read(fromTree->Xml());
  Fuzz::Require(canonical != nullptr && SsoClient::Testing::AllValues(*canonical) == values);
  Fuzz::Require(ReadTree(fromTree->Xml())->Xml() == fromTree->Xml());
}

// Except at the very instant at which a period begins or ends, while the library reads the token.
void RequireRightVerdict(const std::string& text, const Fuzz::ModelToken& model, long tolerance) {
  const long before = Now();
  const bool isAccepted = Read(text, tolerance) != nullptr;
  const long after = Now();
  const bool wasCurrent = Fuzz::IsCurrent(model, before, tolerance * kSecond);
  if (wasCurrent == Fuzz::IsCurrent(model, after, tolerance * kSecond)) {
    Fuzz::Require(isAccepted == wasCurrent);
  }
}

// With a tolerance with which the period has just begun or not yet, or has just ended or not yet.
// The length of the text determines which.
void RequireRightPeriod(const std::string& text, const Fuzz::ModelToken& model) {
  const long untilStart = (model.notBefore - Now()) / kSecond;
  const long untilEnd = (model.notOnOrAfter - Now()) / kSecond;
  const long tolerance = text.size() % 2 == 0 ? untilStart : -untilEnd;
  RequireRightVerdict(text, model, text.size() % 4 < 2 ? tolerance - 5 : tolerance + 5);
}

}  // namespace

extern "C" std::size_t LLVMFuzzerCustomMutator(std::uint8_t* data, std::size_t size,
                                               std::size_t maxSize, unsigned seed) {
  return Fuzz::MutateXml(data, size, maxSize, seed);
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text = Fuzz::TextOf(data, size);
  const auto token = Read(text);
  const auto document = Fuzz::ParseXml(text);
  if (document == nullptr) {
    Fuzz::Require(token == nullptr);
    return 0;
  }
  if (!Fuzz::HasOddNamespace(*document)) {
    const auto model = Fuzz::ReadByModel(text, *document);
    Fuzz::Require((token != nullptr) == model.has_value());
    if (model) {
      Fuzz::RequireValues(*token, *model);
      RequireRightPeriod(text, *model);
    }
  }
  if (token != nullptr) {
    RequireSameFromTree(text, *token);
  }
  return 0;
}
