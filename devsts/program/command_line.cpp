#include "command_line.h"

#include <algorithm>
#include <stdexcept>

namespace DevSts::Program {
namespace {

// Reads the quoted word that begins at `at`, and moves `at` after its end.
std::string QuotedWord(const std::string& line, std::size_t& at) {
  std::string word;
  for (++at; at < line.size() && line[at] != '"'; ++at) {
    const bool isEscape =
        line[at] == '\\' && at + 1 < line.size() && (line[at + 1] == '"' || line[at + 1] == '\\');
    at += isEscape ? 1 : 0;
    word += line[at];
  }
  if (at >= line.size() || (at + 1 < line.size() && line[at + 1] != ' ')) {
    throw std::invalid_argument("a quotation mark is missing, or no space follows it");
  }
  ++at;
  return word;
}

std::string Quoted(const std::string& word) {
  std::string quoted = "\"";
  for (const char character : word) {
    if (character == '"' || character == '\\') {
      quoted += '\\';
    }
    quoted += character;
  }
  return quoted + "\"";
}

}  // namespace

std::vector<std::string> WordsOf(const std::string& line) {
  std::vector<std::string> words;
  for (std::size_t at = 0; at < line.size();) {
    if (line[at] == ' ') {
      ++at;
    } else if (line[at] == '"') {
      words.push_back(QuotedWord(line, at));
    } else {
      const std::size_t end = std::min(line.find(' ', at), line.size());
      words.push_back(line.substr(at, end - at));
      at = end;
    }
  }
  return words;
}

std::string LineOf(const std::vector<std::string>& words) {
  std::string line;
  for (const std::string& word : words) {
    if (word.find_first_of(std::string("\r\n\0", 3)) != std::string::npos) {
      throw std::invalid_argument("a command cannot contain a line break");
    }
    const bool isPlain = !word.empty() && word[0] != '"' && word.find(' ') == std::string::npos;
    line += (line.empty() ? "" : " ") + (isPlain ? word : Quoted(word));
  }
  return line;
}

}  // namespace DevSts::Program
