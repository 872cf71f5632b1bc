#include "support/temporary_file.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <stdexcept>

#include <gtest/gtest.h>
#include <unistd.h>

namespace Tarnik::Testing {
namespace {

std::string NamePattern() {
  return testing::TempDir() + "tarnik_XXXXXX";
}

}  // namespace

TemporaryFile::TemporaryFile(const std::string& content) : path_(NamePattern()) {
  const int descriptor = mkstemp(path_.data());
  if (descriptor < 0 ||
      write(descriptor, content.data(), content.size()) != static_cast<ssize_t>(content.size())) {
    throw std::runtime_error("cannot write a temporary file");
  }
  close(descriptor);
}

TemporaryFile::~TemporaryFile() {
  unlink(path_.c_str());
}

TemporaryFolder::TemporaryFolder() : path_(NamePattern()) {
  if (mkdtemp(path_.data()) == nullptr) {
    throw std::runtime_error("cannot make a temporary folder");
  }
}

TemporaryFolder::~TemporaryFolder() {
  std::filesystem::remove_all(path_);
}

std::string TemporaryFolder::Write(const std::string& name, const std::string& content) const {
  const std::string path = path_ + "/" + name;
  if (!(std::ofstream(path) << content)) {
    throw std::runtime_error("cannot write a temporary file");
  }
  return path;
}

}  // namespace Tarnik::Testing
