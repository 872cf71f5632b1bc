#include "vocabulary.h"

namespace DevSts::Program {

std::string DescribeWord(const std::string& name, const std::string& value,
                         const std::string& meaning) {
  constexpr std::size_t kColumn = 36;
  std::string line = "  " + name + (value.empty() ? "" : "=" + value);
  if (line.size() + 1 < kColumn) {
    line.resize(kColumn, ' ');
  } else {
    line += "\n" + std::string(kColumn, ' ');
  }
  return line + meaning + "\n";
}

}  // namespace DevSts::Program
