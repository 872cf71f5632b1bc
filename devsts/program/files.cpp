#include "files.h"

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <utility>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "errors.h"

namespace DevSts::Program {
namespace {

constexpr std::size_t kMaxSize = std::size_t{4} << 20U;

[[noreturn]] void ThrowFor(const std::string& path, const std::string& what, int error) {
  throw FileError(path + ": " + what + ": " + std::strerror(error));
}

}  // namespace

std::string ReadWhole(const std::string& path) {
  const Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC));
  if (file.Get() < 0) {
    ThrowFor(path, "cannot be read", errno);
  }
  std::string text;
  std::string block(65536, '\0');
  for (;;) {
    const ssize_t size = read(file.Get(), block.data(), block.size());
    if (size < 0) {
      ThrowFor(path, "cannot be read", errno);
    }
    if (size == 0) {
      return text;
    }
    text.append(block, 0, static_cast<std::size_t>(size));
    if (text.size() > kMaxSize) {
      throw FileError(path + ": the file is too large");
    }
  }
}

void WriteWhole(const std::string& path, const std::string& text, Readers readers) {
  std::string pattern = path + ".XXXXXX";
  Descriptor file(mkostemp(pattern.data(), O_CLOEXEC));
  const mode_t mode = readers == Readers::OwnerOnly ? 0600 : 0644;
  bool done = file.Get() >= 0 && fchmod(file.Get(), mode) == 0;
  for (std::size_t at = 0; done && at < text.size();) {
    const ssize_t size = write(file.Get(), text.data() + at, text.size() - at);
    done = size > 0;
    at += done ? static_cast<std::size_t>(size) : 0;
  }
  done = done && fsync(file.Get()) == 0 && std::rename(pattern.c_str(), path.c_str()) == 0;
  if (!done) {
    const int error = errno;
    if (file.Get() >= 0) {
      unlink(pattern.c_str());
    }
    ThrowFor(path, "cannot be written", error);
  }
}

void MakeFolder(const std::string& path) {
  std::error_code error;
  std::filesystem::create_directories(path, error);
  if (error || !std::filesystem::is_directory(path)) {
    ThrowFor(path, "the folder cannot be made", error ? error.value() : ENOTDIR);
  }
}

bool Exists(const std::string& path) {
  struct stat found {};
  return lstat(path.c_str(), &found) == 0;
}

TemporaryFile::TemporaryFile(std::string path, std::string text)
    : path_(std::move(path)), text_(std::move(text)) {
  WriteWhole(path_, text_);
}

TemporaryFile::~TemporaryFile() {
  std::ifstream file(path_, std::ios::binary);
  const std::string found{std::istreambuf_iterator<char>(file), {}};
  if (found == text_) {
    unlink(path_.c_str());
  }
}

Descriptor::~Descriptor() {
  if (number_ >= 0) {
    close(number_);
  }
}

Descriptor::Descriptor(Descriptor&& other) noexcept : number_(std::exchange(other.number_, -1)) {}

Descriptor& Descriptor::operator=(Descriptor&& other) noexcept {
  std::swap(number_, other.number_);
  return *this;
}

void WriteToDescriptor(int descriptor, const std::string& text) {
  for (std::size_t at = 0; at < text.size();) {
    const ssize_t size = write(descriptor, text.data() + at, text.size() - at);
    if (size < 0 && errno == EINTR) {
      continue;
    }
    if (size <= 0) {
      return;
    }
    at += static_cast<std::size_t>(size);
  }
}

}  // namespace DevSts::Program
