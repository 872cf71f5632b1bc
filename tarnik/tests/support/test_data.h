#ifndef TARNIK_TESTS_SUPPORT_TEST_DATA_H
#define TARNIK_TESTS_SUPPORT_TEST_DATA_H

#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string>

namespace Tarnik::Testing {

/// The content of a file below tests/data.
inline std::string ReadTestData(const std::string& name) {
  std::ifstream file(std::string(TARNIK_TEST_DATA) + "/" + name, std::ios::binary);
  if (!file) {
    throw std::runtime_error("test data is missing: " + name);
  }
  return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
}

}  // namespace Tarnik::Testing

#endif
