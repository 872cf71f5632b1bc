#include "input/private_file.h"

#include <array>
#include <cerrno>
#include <utility>

#include <CLI/CLI.hpp>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <tarnik/text/string_util.h>

#include "failure.h"
#include "input/descriptor.h"

namespace SsoClient::Tool {
namespace {

[[noreturn]] void Fail(const std::string& what, const std::string& message,
                       const std::string& remedy = "") {
  throw ToolException({ExitStatus::kLocal, what + "-file", message, remedy});
}

// Passed on with the file, so that what is checked is what is read.
void CheckMode(int descriptor, const PrivateFile& file) {
  struct stat status {};
  if (fstat(descriptor, &status) != 0) {
    Fail(file.what, "cannot read " + file.path + ": " + SystemMessage(errno));
  }
  if (S_ISDIR(status.st_mode)) {
    Fail(file.what, file.path + " is a folder");
  }
  const mode_t others = S_IRGRP | S_IWGRP | S_IROTH | S_IWOTH;
  if ((status.st_mode & others) != 0 && !file.mayBeOpen) {
    throw ToolException({ExitStatus::kLocal, file.what + "-file-open",
                         "other users can read or change the " + file.what + " file " + file.path,
                         "run 'chmod 600' on it, or allow it with --allow-open-files"});
  }
}

}  // namespace

void AddOpenFilesOption(CLI::App& command, bool& mayBeOpen) {
  command.add_flag("--allow-open-files", mayBeOpen,
                   "Accept secrets, keys and tokens in files that other users can read or change");
}

SecretText ReadPrivateFile(const PrivateFile& file) {
  const Descriptor descriptor(open(file.path.c_str(), O_RDONLY | O_CLOEXEC | O_NOCTTY));
  if (descriptor.Get() < 0) {
    Fail(file.what,
         "cannot open the " + file.what + " file " + file.path + ": " + SystemMessage(errno));
  }
  CheckMode(descriptor.Get(), file);
  return ReadDescriptor(descriptor.Get(), file.path, file.what, file.maxBytes);
}

SecretText ReadDescriptor(int descriptor, const std::string& name, const std::string& what,
                          std::size_t maxBytes) {
  constexpr std::size_t kAtOnce = std::size_t{64} * 1024;
  SecretText content;
  std::string buffer(kAtOnce, '\0');
  for (;;) {
    const ssize_t size =
        RetryInterrupted([&] { return read(descriptor, buffer.data(), buffer.size()); });
    if (size <= 0) {
      const int error = errno;
      Tarnik::StringUtil::Cleanse(buffer);
      if (size < 0) {
        Fail(what, "cannot read " + name + ": " + SystemMessage(error));
      }
      return content;
    }
    content.Append(buffer.data(), static_cast<std::size_t>(size));
    if (content.Text().size() > maxBytes) {
      Tarnik::StringUtil::Cleanse(buffer);
      Fail(what, name + " is larger than " + std::to_string(maxBytes) + " bytes");
    }
  }
}

}  // namespace SsoClient::Tool
