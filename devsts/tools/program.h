#ifndef DEVSTS_PROGRAM_H
#define DEVSTS_PROGRAM_H

#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

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

// The same for a file that only the owner may read.
inline void WriteSecretFile(const std::string& path, const std::string& text) {
  const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, S_IRUSR | S_IWUSR);
  // An existing file would keep its mode, which could allow others to read it.
  const bool ours = file >= 0 && fchmod(file, S_IRUSR | S_IWUSR) == 0;
  if (file >= 0) {
    close(file);
  }
  if (!ours) {
    throw std::runtime_error("cannot write " + path);
  }
  WriteFile(path, text);
}

}  // namespace DevSts

#endif
