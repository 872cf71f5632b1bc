#include "secret_text.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <utility>
#include <vector>

#include <tarnik/text/display_text.h>
#include <tarnik/text/string_util.h>

namespace SsoClient::Access {

namespace {

constexpr std::size_t kSearched = 4096;
constexpr std::size_t kLongestEscape = 10;  // of one byte, "&amp;#x3c;"
constexpr std::size_t kShortestPart = 4;
constexpr int kMaxEscapings = 4;
// Ends a text that was cut.
constexpr std::string_view kEllipsis = "...";
constexpr std::size_t kMaxRecordText = 1000;

/// A part of a text: from the first index to before the second.
using Range = std::pair<std::size_t, std::size_t>;

/// A text that was derived from another one, and where each of its bytes comes from. It may contain
/// the secret, so its text never grows, which would release a copy, and is overwritten in the end.
struct Derived {
  std::string text;
  std::vector<Range> origins;

  Derived() = default;
  /// For a text of at most `size` bytes.
  explicit Derived(std::size_t size) {
    text.reserve(size);
    origins.reserve(size);
  }
  Derived(Derived&&) = default;
  Derived& operator=(Derived&&) = delete;
  ~Derived() { Tarnik::StringUtil::Cleanse(text); }

  void Add(char byte, const Range& origin) {
    text.push_back(byte);
    origins.push_back(origin);
  }
};

void AppendUtf8(std::string& text, std::uint32_t code) {
  const auto add = [&text](std::uint32_t byte) { text.push_back(static_cast<char>(byte)); };
  if (code < 0x80) {
    add(code);
    return;
  }
  if (code < 0x800) {
    add(0xC0 | (code >> 6));
  } else {
    if (code < 0x10000) {
      add(0xE0 | (code >> 12));
    } else {
      add(0xF0 | (code >> 18));
      add(0x80 | ((code >> 12) & 0x3F));
    }
    add(0x80 | ((code >> 6) & 0x3F));
  }
  add(0x80 | (code & 0x3F));
}

// The character of a reference such as "#x3c", without the ampersand and the semicolon.
std::optional<std::string> Resolve(std::string_view name) {
  constexpr std::array<std::pair<std::string_view, char>, 5> kNamed{
      {{"amp", '&'}, {"lt", '<'}, {"gt", '>'}, {"quot", '"'}, {"apos", '\''}}};
  for (const auto& [known, character] : kNamed) {
    if (name == known) {
      return std::string(1, character);
    }
  }
  if (!name.starts_with('#')) {
    return std::nullopt;
  }
  name.remove_prefix(1);
  const bool isHex = name.starts_with('x') || name.starts_with('X');
  name.remove_prefix(isHex ? 1 : 0);
  std::uint32_t code = 0;
  const char* const end = name.data() + name.size();
  const auto read = std::from_chars(name.data(), end, code, isHex ? 16 : 10);
  if (read.ec != std::errc() || read.ptr != end || code > 0x10FFFF) {
    return std::nullopt;
  }
  std::string character;
  AppendUtf8(character, code);
  return character;
}

// Without one level of escapes. A character is not longer than a reference to it.
Derived Unescape(const Derived& from) {
  constexpr std::size_t kMaxName = 12;
  Derived result(from.text.size());
  for (std::size_t at = 0; at < from.text.size(); ++at) {
    const std::size_t end = from.text[at] == '&' ? from.text.find(';', at) : std::string::npos;
    const auto character = end == std::string::npos || end - at > kMaxName
                               ? std::nullopt
                               : Resolve(std::string_view(from.text).substr(at + 1, end - at - 1));
    if (!character) {
      result.Add(from.text[at], from.origins[at]);
      continue;
    }
    for (const char byte : *character) {
      result.Add(byte, {from.origins[at].first, from.origins[end].second});
    }
    at = end;
  }
  return result;
}

// Without escapes, and with one character for blanks and all that may replace them.
Derived Normalise(std::string_view text) {
  Derived result(text.size());
  for (std::size_t at = 0; at < text.size(); ++at) {
    result.Add(text[at], {at, at + 1});
  }
  for (int level = 0; level < kMaxEscapings; ++level) {
    Derived next = Unescape(result);
    std::swap(result.text, next.text);
    std::swap(result.origins, next.origins);
    if (result.text.size() == next.text.size()) {
      break;
    }
  }
  for (char& byte : result.text) {
    const auto value = static_cast<unsigned char>(byte);
    byte = value <= 0x20 || value == 0x7F ? '?' : byte;
  }
  return result;
}

// Adds where `sought` is, and where a beginning of it ends the text (Knuth, Morris and Pratt).
void FindAll(std::string_view text, std::string_view sought, std::vector<Range>& found) {
  if (sought.empty()) {
    return;
  }
  std::vector<std::size_t> borders(sought.size() + 1, 0);
  const auto extend = [&](std::size_t matched, char byte) {
    while (matched > 0 && (matched == sought.size() || sought[matched] != byte)) {
      matched = borders[matched];
    }
    return sought[matched] == byte ? matched + 1 : 0;
  };
  for (std::size_t length = 2; length <= sought.size(); ++length) {
    borders[length] = extend(borders[length - 1], sought[length - 1]);
  }
  std::size_t matched = 0;
  for (std::size_t at = 0; at < text.size(); ++at) {
    matched = extend(matched, text[at]);
    if (matched == sought.size()) {
      found.emplace_back(at + 1 - matched, at + 1);
    }
  }
  if (matched >= kShortestPart && matched < sought.size()) {
    found.emplace_back(text.size() - matched, text.size());
  }
}

std::string_view WithoutEllipsis(std::string_view text) {
  return text.ends_with(kEllipsis) ? text.substr(0, text.size() - kEllipsis.size()) : text;
}

std::vector<Range> Occurrences(std::string_view text, std::string_view secret) {
  std::vector<Range> found;
  Derived displayed;  // as a message of the client shows the secret
  displayed.text = Tarnik::ToDisplayText(secret, secret.size());
  const Derived plainSecret = Normalise(secret);
  const Derived plain = Normalise(text);
  std::vector<Range> derived;
  // The ellipsis is no part of the secret, or it is.
  for (const bool isCut : {false, true}) {
    const auto searched = [isCut](std::string_view all) {
      return isCut ? WithoutEllipsis(all) : all;
    };
    FindAll(searched(text), secret, found);
    FindAll(searched(text), displayed.text, found);
    FindAll(searched(plain.text), plainSecret.text, derived);
    if (!text.ends_with(kEllipsis)) {
      break;
    }
  }
  for (const auto& [begin, end] : derived) {
    found.emplace_back(plain.origins[begin].first, plain.origins[end - 1].second);
  }
  std::sort(found.begin(), found.end());
  return found;
}

// Of a character that is not in the secret, so that no new occurrence arises.
std::string MaskFor(std::string_view secret) {
  for (const char mark : std::string_view("*#-_=+~.0")) {
    if (secret.find(mark) == std::string_view::npos) {
      return std::string(3, mark);
    }
  }
  return {};
}

}  // namespace

std::string HideSecret(std::string text, std::string_view secret) {
  if (secret.empty()) {
    return text;
  }
  const std::size_t limit = kSearched + kLongestEscape * secret.size();
  if (text.size() > limit) {
    // What is cut off stays in the buffer otherwise.
    std::fill(text.begin() + static_cast<std::ptrdiff_t>(limit), text.end(), '\0');
    text.resize(limit);
  }
  const std::vector<Range> found = Occurrences(text, secret);
  if (found.empty()) {
    return text;
  }
  const std::string mask = MaskFor(secret);
  std::string shown;
  std::size_t at = 0;
  for (const auto& [begin, end] : found) {
    if (begin >= at) {
      shown.append(text, at, begin - at).append(mask);
      // Without a mask, what follows could complete another occurrence.
      if (mask.empty()) {
        at = text.size();
        break;
      }
    }
    at = std::max(at, end);
  }
  shown.append(text, at);
  Tarnik::StringUtil::Cleanse(text);
  return shown;
}

std::string ToRecordText(std::string_view text) {
  return text.size() <= kMaxRecordText
             ? Tarnik::ToDisplayText(text, kMaxRecordText)
             : Tarnik::ToDisplayText(text, kMaxRecordText - kEllipsis.size());
}

}  // namespace SsoClient::Access
