#ifndef SSOCLIENT_TESTS_SUPPORT_TOKEN_EDITS_H
#define SSOCLIENT_TESTS_SUPPORT_TOKEN_EDITS_H

#include <cstddef>
#include <cstdint>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

namespace SsoClient::Testing {

/// A text that occurs once in the assertion of `AssertionText().Delegate()`, and another one.
struct Edit {
  const char* from;
  const char* to;
};

/// Edits of a signed text that its canonical form does not show.
const std::vector<Edit>& NeutralEdits();
/// Edits of values that are read. Without a check of the signature the text is accepted.
const std::vector<Edit>& ValueEdits();

/// A value in the same assertion, and where a node may split it.
struct SplitValue {
  const char* name;
  std::string value;  ///< occurs once in the text
  std::size_t at;
};
void PrintTo(const SplitValue& split, std::ostream* stream);

const std::vector<SplitValue>& SplitValues();
/// `xml` with `node` inside the value.
std::string SplitBy(const std::string& xml, const SplitValue& split, const std::string& node);

/// The text of a date and its canonical form, which is empty for a text that is refused.
struct DateText {
  std::string text;
  std::string canonical;
};
const std::vector<DateText>& DateTexts();

/// The text of a count and its value; none for a text that is refused.
struct CountText {
  const char* text;
  std::optional<std::uint32_t> count;
};
const std::vector<CountText>& CountTexts();

}  // namespace SsoClient::Testing

#endif
