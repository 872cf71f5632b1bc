#include "value_forms.h"

#include <algorithm>
#include <array>
#include <charconv>

namespace DevSts::Program {
namespace {

// The clocks count nanoseconds in 64 bits.
constexpr std::chrono::milliseconds kLongestTime = std::chrono::hours(24L * 36500);

[[noreturn]] void ThrowNot(const char* form, const std::string& text) {
  throw std::invalid_argument("'" + text + "' is not " + form);
}

char OctetFromHex(const std::string& text, std::size_t at) {
  unsigned value = 0;
  const char* begin = text.data() + at;
  const char* end = text.data() + std::min(at + 2, text.size());
  const auto [last, error] = std::from_chars(begin, end, value, 16);
  if (error != std::errc() || last != begin + 2) {
    ThrowNot("a text whose \\x is followed by two hexadecimal digits", text);
  }
  return static_cast<char>(value);
}

}  // namespace

std::uint64_t NumberFrom(const std::string& text, std::uint64_t max) {
  std::uint64_t value = 0;
  const char* end = text.data() + text.size();
  const auto [last, error] = std::from_chars(text.data(), end, value);
  if (text.empty() || error != std::errc() || last != end || value > max) {
    ThrowNot(("a number from 0 to " + std::to_string(max)).c_str(), text);
  }
  return value;
}

bool FlagFrom(const std::string& text) {
  return ChoiceFrom<bool>(text, {{"yes", true}, {"no", false}});
}

std::chrono::milliseconds TimeFrom(const std::string& text) {
  constexpr std::array<std::pair<const char*, std::int64_t>, 5> kUnits{
      {{"ms", 1}, {"s", 1000}, {"m", 60'000}, {"h", 3'600'000}, {"d", 86'400'000}}};
  const std::size_t digits = std::min(text.find_first_not_of("0123456789"), text.size());
  for (const auto& [unit, milliseconds] : kUnits) {
    if (text.substr(digits) != unit || digits == 0) {
      continue;
    }
    const std::uint64_t most = static_cast<std::uint64_t>(kLongestTime.count() / milliseconds);
    return std::chrono::milliseconds(
        static_cast<std::int64_t>(NumberFrom(text.substr(0, digits), most)) * milliseconds);
  }
  ThrowNot("a time such as 500ms, 2s, 5m, 1h or 30d", text);
}

std::chrono::milliseconds OffsetFrom(const std::string& text) {
  const char sign = text.empty() ? '\0' : text[0];
  if (sign != '+' && sign != '-') {
    ThrowNot("a sign and a time, such as +10m or -90s", text);
  }
  const std::chrono::milliseconds time = TimeFrom(text.substr(1));
  return sign == '-' ? -time : time;
}

std::string OctetsFrom(const std::string& text) {
  constexpr std::array<std::pair<char, char>, 4> kEscapes{
      {{'r', '\r'}, {'n', '\n'}, {'t', '\t'}, {'\\', '\\'}}};
  std::string octets;
  for (std::size_t i = 0; i < text.size(); ++i) {
    if (text[i] != '\\') {
      octets += text[i];
      continue;
    }
    const char escape = ++i < text.size() ? text[i] : '\0';
    const auto* known = std::find_if(kEscapes.begin(), kEscapes.end(),
                                     [&](const auto& pair) { return pair.first == escape; });
    if (known != kEscapes.end()) {
      octets += known->second;
    } else if (escape == 'x') {
      octets += OctetFromHex(text, i + 1);
      i += 2;
    } else {
      ThrowNot("a text whose backslashes begin \\r, \\n, \\t, \\\\ or \\xHH", text);
    }
  }
  return octets;
}

std::pair<std::string, std::string> HeaderFrom(const std::string& text) {
  const std::size_t colon = text.find(": ");
  if (colon == std::string::npos || colon == 0) {
    ThrowNot("of the form 'NAME: VALUE'", text);
  }
  return {text.substr(0, colon), OctetsFrom(text.substr(colon + 2))};
}

std::vector<std::string> ListFrom(const std::string& text) {
  std::vector<std::string> parts;
  for (std::size_t begin = 0; begin <= text.size();) {
    const std::size_t end = std::min(text.find(',', begin), text.size());
    parts.push_back(text.substr(begin, end - begin));
    begin = end + 1;
    if (parts.back().empty()) {
      ThrowNot("a list with commas between its parts", text);
    }
  }
  return parts;
}

std::pair<std::string, std::string> HalvesFrom(const std::string& text) {
  const std::size_t slash = text.find('/');
  return slash == std::string::npos ? std::pair(text, std::string())
                                    : std::pair(text.substr(0, slash), text.substr(slash + 1));
}

std::string ShellWord(const std::string& value) {
  constexpr const char* kPlain =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789_./:@%+=,[]-";
  if (value.find_first_not_of(kPlain) == std::string::npos) {
    return value;
  }
  std::string word = "'";
  for (const char c : value) {
    word += c == '\'' ? "'\\''" : std::string(1, c);
  }
  return word + "'";
}

void Substitution::operator()(std::string& text) const {
  for (std::size_t at = text.find(from); at != std::string::npos;
       at = text.find(from, at + to.size())) {
    text.replace(at, from.size(), to);
  }
}

Substitution SubstitutionFrom(const std::string& text) {
  const char mark = text.empty() ? '\0' : text[0];
  const std::size_t middle = text.find(mark, 1);
  if (middle == std::string::npos || middle < 2 || mark == '\\' ||
      text.find(mark, middle + 1) != text.size() - 1) {
    ThrowNot("of the form '/FROM/TO/'", text);
  }
  return {OctetsFrom(text.substr(1, middle - 1)),
          OctetsFrom(text.substr(middle + 1, text.size() - middle - 2))};
}

}  // namespace DevSts::Program
