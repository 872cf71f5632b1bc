#ifndef FUZZ_WORDS_H
#define FUZZ_WORDS_H

#include <string>
#include <string_view>
#include <vector>

namespace Fuzz {

using Words = std::vector<std::string>;

/// The words of each line that has any.
std::vector<Words> LinesOfWords(std::string_view text);

}  // namespace Fuzz

#endif
