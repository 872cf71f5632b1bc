#include "words.h"

#include <sstream>
#include <utility>

namespace Fuzz {

std::vector<Words> LinesOfWords(std::string_view text) {
  std::vector<Words> lines;
  std::istringstream input{std::string(text)};
  for (std::string line; std::getline(input, line);) {
    std::istringstream words(line);
    Words read;
    for (std::string word; words >> word;) {
      read.push_back(word);
    }
    if (!read.empty()) {
      lines.push_back(std::move(read));
    }
  }
  return lines;
}

}  // namespace Fuzz
