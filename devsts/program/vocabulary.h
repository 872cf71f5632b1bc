#ifndef DEVSTS_PROGRAM_VOCABULARY_H
#define DEVSTS_PROGRAM_VOCABULARY_H

#include <stdexcept>
#include <string>
#include <vector>

namespace DevSts::Program {

// One of the names of a closed list, with which an option or a control command changes a `Target`.
template <typename Target>
struct Word {
  const char* name;
  const char* value;  // the form of its value; empty if it has none
  const char* meaning;
  void (*apply)(const std::string& value, Target& target);
};

template <typename Target>
using Vocabulary = std::vector<Word<Target>>;

// A line of a list of names.
std::string DescribeWord(const std::string& name, const std::string& value,
                         const std::string& meaning);

template <typename Target>
std::string Describe(const Vocabulary<Target>& words) {
  std::string text;
  for (const Word<Target>& word : words) {
    text += DescribeWord(word.name, word.value, word.meaning);
  }
  return text;
}

// Applies a text of the form NAME or NAME=VALUE. Throws std::invalid_argument if there is no such
// name, or its value is missing, unexpected or has another form.
template <typename Target>
void Apply(const Vocabulary<Target>& words, const std::string& text, Target& target) {
  const std::size_t sign = text.find('=');
  const std::string name = text.substr(0, sign);
  for (const Word<Target>& word : words) {
    if (name != word.name) {
      continue;
    }
    if ((word.value[0] == '\0') != (sign == std::string::npos)) {
      throw std::invalid_argument(name +
                                  (word.value[0] == '\0' ? " has no value" : " needs a value"));
    }
    try {
      word.apply(sign == std::string::npos ? "" : text.substr(sign + 1), target);
    } catch (const std::invalid_argument& error) {
      throw std::invalid_argument(name + ": " + error.what());
    }
    return;
  }
  throw std::invalid_argument("there is no name '" + name + "'; see --help-misbehaviour");
}

// The result of applying each text to the target.
template <typename Target>
Target Applied(const Vocabulary<Target>& words, const std::vector<std::string>& texts,
               Target target = {}) {
  for (const std::string& text : texts) {
    Apply(words, text, target);
  }
  return target;
}

}  // namespace DevSts::Program

#endif
