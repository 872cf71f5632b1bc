// Every token that a resolver accepts has the signed values, and an independent verifier of XML
// signatures accepts it too. The input determines how signed assertions are edited, not what they
// contain.
#include <optional>

#include <fuzzer/FuzzedDataProvider.h>

#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>

#include "input.h"
#include "support/assertion_text.h"
#include "support/second_opinion.h"
#include "support/token_editor.h"
#include "support/token_values.h"

namespace {

std::optional<std::string> AcceptedValues(const std::string& xml) {
  static const auto resolver = SsoClient::Testing::TrustedResolver();
  try {
    return SsoClient::Testing::AllValues(
        *SsoClient::CreateSamlToken(xml, resolver.get(), 1'000'000));
  } catch (const Tarnik::Exception&) {
    return std::nullopt;
  }
}

struct Original {
  std::string xml;
  std::string values;
};

// One assertion for each canonical form, with different parts.
const std::vector<Original>& Originals() {
  static const std::vector<Original> originals = [] {
    std::vector<Original> all;
    for (std::size_t kind = 0; kind < 8; ++kind) {
      SsoClient::Testing::TokenEditor maker([kind](std::size_t bound) { return kind % bound; });
      const std::string xml = maker.SignedXml();
      const auto values = AcceptedValues(xml);
      Fuzz::Require(values.has_value());
      all.push_back({xml, *values});
    }
    return all;
  }();
  return originals;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  FuzzedDataProvider input(data, size);
  const Original& original =
      Originals()[input.ConsumeIntegralInRange<std::size_t>(0, Originals().size() - 1)];
  SsoClient::Testing::TokenEditor editor([&input](std::size_t bound) {
    return input.ConsumeIntegralInRange<std::size_t>(0, bound - 1);
  });
  std::string xml = original.xml;
  for (int edits = 0; edits < 6 && input.remaining_bytes() > 0; ++edits) {
    editor.Edit(xml);
  }
  const auto values = AcceptedValues(xml);
  if (values) {
    Fuzz::Require(*values == original.values);
    Fuzz::Require(SsoClient::Testing::SecondOpinionOf(xml).empty());
  }
  return 0;
}
