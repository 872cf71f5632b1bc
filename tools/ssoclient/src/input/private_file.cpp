#include "input/private_file.h"

#include <cerrno>

#include <CLI/CLI.hpp>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <tarnik/text/string_util.h>

#include "failure.h"
#include "input/descriptor.h"

namespace SsoClient::Tool {
namespace {

// A buffer that its destructor overwrites.
struct CleansedBuffer {
  explicit CleansedBuffer(std::size_t size) : octets(size, '\0') {}
  ~CleansedBuffer() { Tarnik::StringUtil::Cleanse(octets); }
  CleansedBuffer(const CleansedBuffer&) = delete;
  CleansedBuffer& operator=(const CleansedBuffer&) = delete;

  std::string octets;
};

[[noreturn]] void Fail(const std::string& what, const std::string& message,
                       const std::string& remedy = "") {
  throw ToolException({ExitStatus::kLocal, KindName::Find(what + "-file"), message, remedy});
}

[[noreturn]] void FailAsOpen(const PrivateFile& file, const std::string& message,
                             const std::string& remedy) {
  throw ToolException({ExitStatus::kLocal, KindName::Find(file.what + "-file-open"), message,
                       remedy + ", or allow it with --allow-open-files"});
}

Descriptor Open(const PrivateFile& file, int flags) {
  Descriptor descriptor(open(file.path.c_str(), flags | O_RDONLY | O_CLOEXEC | O_NOCTTY));
  if (descriptor.Get() < 0) {
    Fail(file.what,
         "cannot open the " + file.what + " file " + file.path + ": " + SystemMessage(errno));
  }
  return descriptor;
}

// Of the descriptor, so that what is checked is what is read.
struct stat StatusOf(const Descriptor& descriptor, const PrivateFile& file) {
  struct stat status {};
  if (fstat(descriptor.Get(), &status) != 0) {
    Fail(file.what, "cannot read " + file.path + ": " + SystemMessage(errno));
  }
  if (S_ISDIR(status.st_mode)) {
    Fail(file.what, file.path + " is a folder");
  }
  return status;
}

void RequireNoExposure(const struct stat& status, const PrivateFile& file) {
  const Exposure exposure = file.mayBeOpen ? Exposure::kNone : ExposureOf(status, geteuid());
  const std::string name = "the " + file.what + " file " + file.path;
  if (exposure == Exposure::kByOwner) {
    FailAsOpen(file, name + " belongs to another user, who can read and change it",
               "use a file of your own");
  }
  if (exposure == Exposure::kByMode) {
    const bool isOwnFile = S_ISREG(status.st_mode) && status.st_uid == geteuid();
    FailAsOpen(file, "other users can read or change " + name,
               isOwnFile ? "run 'chmod 600' on it if nobody else needs it"
                         : "use a file that only you can read");
  }
}

}  // namespace

Exposure ExposureOf(const struct stat& status, uid_t user) {
  if (status.st_uid != user && status.st_uid != 0) {
    return Exposure::kByOwner;
  }
  const mode_t others = S_IRGRP | S_IWGRP | S_IROTH | S_IWOTH;
  return (status.st_mode & others) != 0 ? Exposure::kByMode : Exposure::kNone;
}

void AddOpenFilesOption(CLI::App& command, bool& mayBeOpen) {
  command.add_flag("--allow-open-files", mayBeOpen,
                   "Accept secrets, keys and tokens in files that other users can read or change");
}

SecretText ReadPrivateFile(const PrivateFile& file) {
  const Descriptor descriptor = Open(file, 0);
  const struct stat status = StatusOf(descriptor, file);
  if (file.isPublic == nullptr) {
    RequireNoExposure(status, file);
  }
  SecretText content = ReadDescriptor(descriptor.Get(), file.path, file.what, file.maxBytes);
  if (file.isPublic != nullptr && !file.isPublic(content.Text())) {
    RequireNoExposure(status, file);
  }
  return content;
}

void CheckPrivateFile(const PrivateFile& file) {
  // A pipe may have nobody yet who writes.
  RequireNoExposure(StatusOf(Open(file, O_NONBLOCK), file), file);
}

SecretText ReadDescriptor(int descriptor, const std::string& name, const std::string& what,
                          std::size_t maxBytes) {
  constexpr std::size_t kAtOnce = std::size_t{64} * 1024;
  SecretText content;
  CleansedBuffer buffer(kAtOnce);
  for (;;) {
    const ssize_t size = RetryInterrupted(
        [&] { return read(descriptor, buffer.octets.data(), buffer.octets.size()); });
    if (size < 0) {
      Fail(what, "cannot read " + name + ": " + SystemMessage(errno));
    }
    if (size == 0) {
      return content;
    }
    content.Append(buffer.octets.data(), static_cast<std::size_t>(size));
    if (content.Text().size() > maxBytes) {
      Fail(what, name + " is larger than " + std::to_string(maxBytes) + " bytes");
    }
  }
}

}  // namespace SsoClient::Tool
