#ifndef DEVSTS_PROGRAM_VALUE_FORMS_H
#define DEVSTS_PROGRAM_VALUE_FORMS_H

#include <chrono>
#include <cstdint>
#include <initializer_list>
#include <limits>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace DevSts::Program {

// The forms of values in options, control commands and accounts files. Each function throws
// std::invalid_argument, with a text for the user, unless the text has its form.

// Decimal digits.
std::uint64_t NumberFrom(const std::string& text,
                         std::uint64_t max = std::numeric_limits<std::uint32_t>::max());
// "yes" or "no".
bool FlagFrom(const std::string& text);
// A number and a unit: ms, s, m, h or d.
std::chrono::milliseconds TimeFrom(const std::string& text);
// Reads a sign and a duration, such as "+10m" or "-90s".
std::chrono::milliseconds OffsetFrom(const std::string& text);
// A text with the escapes \r, \n, \t, \\ and \xHH.
std::string OctetsFrom(const std::string& text);
// "NAME: VALUE".
std::pair<std::string, std::string> HeaderFrom(const std::string& text);
// The parts between commas, none of which is empty.
std::vector<std::string> ListFrom(const std::string& text);
// "FIRST" or "FIRST/SECOND"; the second text is empty if it is missing.
std::pair<std::string, std::string> HalvesFrom(const std::string& text);

// The value as a shell reads it back: in single quotes, unless it is one word without them.
std::string ShellWord(const std::string& value);

// Replaces each occurrence of a text.
struct Substitution {
  std::string from;
  std::string to;

  void operator()(std::string& text) const;
};

// "/FROM/TO/", in which any other character can replace the slash, with the escapes of OctetsFrom.
Substitution SubstitutionFrom(const std::string& text);

// The value of the choice with this name.
template <typename T>
T ChoiceFrom(const std::string& text, std::initializer_list<std::pair<const char*, T>> choices) {
  std::string names;
  for (const auto& [name, value] : choices) {
    if (text == name) {
      return value;
    }
    names += std::string(names.empty() ? "" : ", ") + name;
  }
  throw std::invalid_argument("'" + text + "' is not one of " + names);
}

}  // namespace DevSts::Program

#endif
