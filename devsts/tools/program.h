#ifndef DEVSTS_PROGRAM_H
#define DEVSTS_PROGRAM_H

#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>

namespace DevSts {

inline std::string ReadFile(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  if (!file) {
    throw std::runtime_error("cannot read " + path);
  }
  std::ostringstream text;
  text << file.rdbuf();
  return text.str();
}

inline void WriteFile(const std::string& path, const std::string& text) {
  std::ofstream file(path, std::ios::binary | std::ios::trunc);
  if (!(file << text).flush()) {
    throw std::runtime_error("cannot write " + path);
  }
}

}  // namespace DevSts

#endif
