// Every token that a resolver accepts has the values that were signed, the model reads the same
// values in it, and an independent verifier of XML signatures accepts it too. A signed assertion
// that the model refuses is refused. The input determines who signs which layout, and how it is
// edited before and after it is signed, not what the texts contain.
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <utility>

#include <fuzzer/FuzzedDataProvider.h>

#include <devsts/xml_security.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>

#include "input.h"
#include "support/second_opinion.h"
#include "support/token_editor.h"
#include "support/token_values.h"
#include "token_comparison.h"
#include "token_entries.h"
#include "token_originals.h"
#include "xml_input.h"

namespace {

using SsoClient::Testing::TokenEditor;
using Token = std::shared_ptr<const SsoClient::SamlToken>;

constexpr long kTolerance = 1'000'000;
constexpr long kMicrosecondsPerSecond = 1'000'000;

Token Read(const std::string& xml, const Fuzz::Signer& signer) {
  try {
    return SsoClient::CreateSamlToken(xml, signer.resolver.get(), kTolerance);
  } catch (const Tarnik::Exception&) {
    return nullptr;
  }
}

void RequireRight(const std::string& xml, const SsoClient::SamlToken& token,
                  const Fuzz::Signer& signer) {
  Fuzz::Require(SsoClient::Testing::SecondOpinionOf(xml, signer.credential.certificatePem).empty());
  const auto document = Fuzz::ParseXml(xml);
  if (Fuzz::HasOddNamespace(*document)) {
    return;
  }
  const auto model = Fuzz::ReadByModel(xml, *document);
  Fuzz::Require(model.has_value());
  Fuzz::Require(Fuzz::IsCurrent(*model, Tarnik::System::GetUtcDateTime().GetUtcTime(),
                                kTolerance * kMicrosecondsPerSecond));
  Fuzz::RequireValues(token, *model);
}

/// The choices that an input makes.
class Choices {
 public:
  Choices(const std::uint8_t* data, std::size_t size)
      : input_(data, size), editor_([this](std::size_t bound) { return Below(bound); }) {}

  std::size_t Below(std::size_t bound) {
    return input_.ConsumeIntegralInRange<std::size_t>(0, bound - 1);
  }
  template <class List>
  const auto& OneOf(const List& list) {
    return list[Below(list.size())];
  }
  void Edit(std::string& xml, int atMost) {
    for (int edits = 0; edits < atMost && input_.remaining_bytes() > 0; ++edits) {
      editor_.Edit(xml);
    }
  }
  bool AreMade() { return input_.remaining_bytes() == 0; }

 private:
  FuzzedDataProvider input_;
  TokenEditor editor_;
};

/// A text to sign, by whom and how.
struct Original {
  std::string text;
  const Fuzz::Signer* signer;
  DevSts::SignOptions options;
  bool isUnchanged = false;  ///< one of the layouts as it is
  bool isFlawed = false;
};

void ChooseOptions(Choices& choices, DevSts::SignOptions& options) {
  options.digest = static_cast<DevSts::DigestAlgorithm>(choices.Below(3));
  options.canonicalization = static_cast<DevSts::CanonicalMode>(choices.Below(4));
  options.keyInfo = static_cast<DevSts::KeyInfoContent>(choices.Below(3));
  if (choices.Below(3) == 0) {
    options.inclusivePrefixes = {"xs", "rsa", "#default"};
  }
}

// Changed texts are signed in one way, the fastest, since there are many of them.
Original MakeOriginal(Choices& choices) {
  Original original{choices.OneOf(Fuzz::Layouts()), Fuzz::Signers().data(), {}};
  const std::size_t change = choices.Below(8);
  if (change < 3) {
    const std::string text = Fuzz::WithFlaw(original.text, choices.OneOf(Fuzz::Flaws()));
    original.isFlawed = text != original.text;
    original.text = text;
  } else if (change == 3) {
    choices.Edit(original.text, 2);
  } else {
    original.isUnchanged = true;
    original.signer = &choices.OneOf(Fuzz::Signers());
    ChooseOptions(choices, original.options);
  }
  original.options.signature = original.signer->algorithm;
  return original;
}

std::optional<std::string> Sign(const Original& original) {
  try {
    return DevSts::SignXml(original.text, original.signer->credential.privateKeyPem,
                           original.signer->credential.certificatePem, original.options);
  } catch (const DevSts::XmlError&) {
    return std::nullopt;
  }
}

/// A signed original, the token in it if it is one, and the values of that token.
struct Signed {
  std::string xml;
  Token token;
  std::string values;
};

// The layouts are made once, and expire while a fuzzer runs for hours.
bool IsValidForAMinute(const SsoClient::SamlToken& token) {
  const long now = Tarnik::System::GetUtcDateTime().GetUtcTime();
  return now + 60 * kMicrosecondsPerSecond < token.ExpirationTime().GetUtcTime();
}

std::optional<Signed> SignAndCheck(const Original& original) {
  const auto xml = Sign(original);
  if (!xml) {
    return std::nullopt;
  }
  const Token token = Read(*xml, *original.signer);
  Fuzz::Require(token != nullptr || !original.isUnchanged);
  Fuzz::Require(token == nullptr || !original.isFlawed);
  if (token == nullptr) {
    return Signed{*xml, nullptr, ""};
  }
  RequireRight(*xml, *token, *original.signer);
  const std::string values = SsoClient::Testing::AllValues(*token);
  if (original.isUnchanged && IsValidForAMinute(*token)) {
    Fuzz::RequireSameFromEveryEntry(*xml, *original.signer, values);
  }
  return Signed{*xml, token, values};
}

// Signing takes longer than everything else, so the last results are kept.
const std::optional<Signed>& SignedOriginal(const Original& original) {
  static std::map<std::string, std::optional<Signed>> known;
  constexpr std::size_t kMaxKnown = 4000;
  const DevSts::SignOptions& options = original.options;
  std::string key = original.text;
  for (const std::size_t choice :
       {static_cast<std::size_t>(original.signer - Fuzz::Signers().data()),
        static_cast<std::size_t>(options.digest),
        static_cast<std::size_t>(options.canonicalization),
        static_cast<std::size_t>(options.keyInfo), options.inclusivePrefixes.size()}) {
    key += "," + std::to_string(choice);
  }
  if (known.size() > kMaxKnown) {
    known.clear();
  }
  const auto at = known.find(key);
  return at != known.end() ? at->second
                           : known.emplace(std::move(key), SignAndCheck(original)).first->second;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  Choices choices(data, size);
  const Original original = MakeOriginal(choices);
  const std::optional<Signed>& first = SignedOriginal(original);
  if (!first || choices.AreMade()) {
    return 0;
  }
  std::string edited = first->xml;
  choices.Edit(edited, 6);
  const Token other = Read(edited, *original.signer);
  if (other != nullptr) {
    RequireRight(edited, *other, *original.signer);
    Fuzz::Require(first->token == nullptr ||
                  SsoClient::Testing::AllValues(*other) == first->values);
  }
  return 0;
}
