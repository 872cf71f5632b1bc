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
  throw FileError(path + ": " + what + ": " +
                  (error == ELOOP ? "symbolic links are not followed here" : std::strerror(error)));
}

// A device, such as /dev/null, must not be replaced by a file.
void RequireNoDevice(const std::string& path) {
  struct stat found {};
  if (stat(path.c_str(), &found) == 0 && !S_ISREG(found.st_mode)) {
    throw FileError(path + ": this is not a regular file");
  }
}

mode_t ModeFor(Readers readers) {
  return readers == Readers::OwnerOnly ? 0600 : 0644;
}

std::string ReadAll(const Descriptor& file, const std::string& path) {
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

}  // namespace

std::string ReadWhole(const std::string& path) {
  return ReadAll(Descriptor(open(path.c_str(), O_RDONLY | O_CLOEXEC)), path);
}

std::string ReadOwnWhole(const std::string& path, Readers readers) {
  const Descriptor file(open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
  struct stat found {};
  if (file.Get() >= 0 && fstat(file.Get(), &found) == 0) {
    if (!S_ISREG(found.st_mode)) {
      throw FileError(path + ": this is not a regular file");
    }
    if (readers == Readers::OwnerOnly && (found.st_mode & (S_IRWXG | S_IRWXO)) != 0) {
      throw FileError(path + ": others have access to the key; run chmod 600 on it");
    }
  }
  return ReadAll(file, path);
}

Descriptor OpenOwn(const std::string& path, int flags, Readers readers) {
  Descriptor file(
      open(path.c_str(), flags | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC, ModeFor(readers)));
  if (file.Get() < 0) {
    ThrowFor(path, "cannot be written", errno);
  }
  return file;
}

void WriteWhole(const std::string& path, const std::string& text, Readers readers) {
  RequireNoDevice(path);
  std::string pattern = path + ".XXXXXX";
  Descriptor file(mkostemp(pattern.data(), O_CLOEXEC));
  bool done = file.Get() >= 0 && fchmod(file.Get(), ModeFor(readers)) == 0;
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

void RemoveFile(const std::string& path) {
  RequireNoDevice(path);
  if (unlink(path.c_str()) != 0 && errno != ENOENT) {
    ThrowFor(path, "cannot be replaced", errno);
  }
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

}  // namespace DevSts::Program
