#ifndef DEVSTS_PROGRAM_COMMAND_LINE_H
#define DEVSTS_PROGRAM_COMMAND_LINE_H

#include <string>
#include <vector>

namespace DevSts::Program {

// The words of a line, which are separated by spaces. A word that begins with a quotation mark ends
// with the next one; in it, \" and \\ are a quotation mark and a backslash. Throws
// std::invalid_argument if a quotation mark is missing.
std::vector<std::string> WordsOf(const std::string& line);

// A line with these words. Throws std::invalid_argument if a word contains a line break.
std::string LineOf(const std::vector<std::string>& words);

}  // namespace DevSts::Program

#endif
