#ifndef SSOCLIENT_TESTS_INTEGRATION_TEXT_EDITS_H
#define SSOCLIENT_TESTS_INTEGRATION_TEXT_EDITS_H

#include <stdexcept>
#include <string>
#include <string_view>

#include <gtest/gtest.h>

namespace SsoClient::Testing {

/// Replaces the first occurrence of `what`. The test fails if it does not occur.
inline void Replace(std::string& text, std::string_view what, std::string_view by) {
  const auto at = text.find(what);
  ASSERT_NE(at, std::string::npos) << what;
  text.replace(at, what.size(), by);
}

/// Removes the first ds:Signature of `xml`. The test fails if it does not occur.
inline void EraseSignature(std::string& xml) {
  constexpr std::string_view kEnd = "</ds:Signature>";
  const auto begin = xml.find("<ds:Signature");
  const auto end = xml.find(kEnd);
  ASSERT_NE(end, std::string::npos);
  xml.erase(begin, end + kEnd.size() - begin);
}

/// The text between the first `start` and the next `end`. Throws if there is no `start`.
inline std::string Between(const std::string& text, const std::string& start,
                           const std::string& end) {
  const auto from = text.find(start);
  if (from == std::string::npos) {
    throw std::runtime_error("not found: " + start);
  }
  const auto begin = from + start.size();
  return text.substr(begin, text.find(end, begin) - begin);
}

}  // namespace SsoClient::Testing

#endif
