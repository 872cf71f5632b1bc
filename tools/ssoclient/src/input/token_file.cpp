#include "input/token_file.h"

#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "failure.h"
#include "input/descriptor.h"
#include "input/ending_signals.h"
#include "input/private_file.h"

namespace SsoClient::Tool {
namespace {

constexpr std::size_t kMaxTokenBytes = std::size_t{16} * 1024 * 1024;
constexpr const char* kStandardStream = "-";
constexpr mode_t kOwnerOnly = S_IRUSR | S_IWUSR;

[[noreturn]] void FailToWrite(const std::string& path, const std::string& reason,
                              const std::string& remedy = "") {
  throw ToolException(
      {ExitStatus::kLocal, "output-file", "cannot write " + path + ": " + reason, remedy});
}

std::string FolderOf(const std::string& path) {
  const std::size_t slash = path.rfind('/');
  if (slash == std::string::npos) {
    return ".";
  }
  return slash == 0 ? "/" : path.substr(0, slash);
}

void CheckDestination(const std::string& path) {
  struct stat status {};
  if (lstat(path.c_str(), &status) != 0) {
    if (errno != ENOENT) {
      FailToWrite(path, SystemMessage(errno));
    }
    return;
  }
  if (S_ISLNK(status.st_mode)) {
    FailToWrite(path, "it is a symbolic link", "name the file that it refers to");
  }
  if (S_ISDIR(status.st_mode)) {
    FailToWrite(path, "it is a folder", "name a file in the folder");
  }
  if (!S_ISREG(status.st_mode)) {
    FailToWrite(path, "it is not a regular file", "use '--output -' and redirect standard output");
  }
}

/// Delays the signals that end or stop a process.
class DelayedSignals {
 public:
  DelayedSignals() {
    sigset_t signals;
    sigemptyset(&signals);
    sigaddset(&signals, SIGTSTP);
    for (const int signal : kEndingSignals) {
      sigaddset(&signals, signal);
    }
    pthread_sigmask(SIG_BLOCK, &signals, &before_);
  }
  ~DelayedSignals() { pthread_sigmask(SIG_SETMASK, &before_, nullptr); }
  DelayedSignals(const DelayedSignals&) = delete;
  DelayedSignals& operator=(const DelayedSignals&) = delete;

 private:
  sigset_t before_{};
};

/// A file under another name in the same folder, removed unless it is renamed.
class NewFile {
 public:
  explicit NewFile(const std::string& path)
      : path_(path),
        temporary_(FolderOf(path) + "/.ssoclient-XXXXXX"),
        descriptor_(mkostemp(temporary_.data(), O_CLOEXEC)) {
    if (descriptor_.Get() < 0) {
      FailToWrite(path_, SystemMessage(errno));
    }
  }
  ~NewFile() {
    if (!isRenamed_) {
      unlink(temporary_.c_str());
    }
  }
  NewFile(const NewFile&) = delete;
  NewFile& operator=(const NewFile&) = delete;

  void Write(const std::string& text) {
    const int descriptor = descriptor_.Get();
    // The umask may have removed permissions of the owner.
    const bool isWritten = fchmod(descriptor, kOwnerOnly) == 0 && WriteAll(descriptor, text) &&
                           WriteAll(descriptor, "\n") && fsync(descriptor) == 0;
    if (!isWritten || !descriptor_.Close()) {
      FailToWrite(path_, SystemMessage(errno));
    }
  }

  void Rename() {
    if (rename(temporary_.c_str(), path_.c_str()) != 0) {
      FailToWrite(path_, SystemMessage(errno));
    }
    isRenamed_ = true;
    // The new name lasts after a power failure, if the file system supports that.
    const Descriptor folder(open(FolderOf(path_).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder.Get() >= 0) {
      fsync(folder.Get());
    }
  }

 private:
  std::string path_;
  std::string temporary_;
  Descriptor descriptor_;
  bool isRenamed_ = false;
};

}  // namespace

bool IsStandardStream(const std::string& path) {
  return path == kStandardStream;
}

SecretText ReadTokenFile(const std::string& path, bool mayBeOpen) {
  const bool isInput = IsStandardStream(path);
  const std::string name = isInput ? "standard input" : path;
  SecretText text = isInput ? ReadDescriptor(STDIN_FILENO, name, "token", kMaxTokenBytes)
                            : ReadPrivateFile({.path = path,
                                               .what = "token",
                                               .maxBytes = kMaxTokenBytes,
                                               .mayBeOpen = mayBeOpen});
  text.Trim();
  if (text.Text().empty()) {
    throw ToolException({ExitStatus::kLocal, "token-file", name + " contains no token", ""});
  }
  return text;
}

void CheckTokenFile(const std::string& path) {
  if (IsStandardStream(path)) {
    if (isatty(STDOUT_FILENO) == 1) {
      throw ToolException({ExitStatus::kUsage, "output-terminal",
                           "the terminal would show the token, which is as good as a password",
                           "name a file with --output, or redirect standard output"});
    }
    return;
  }
  CheckDestination(path);
  const std::string folder = FolderOf(path);
  if (faccessat(AT_FDCWD, folder.c_str(), W_OK | X_OK, AT_EACCESS) != 0) {
    FailToWrite(path, "the folder " + folder + ": " + SystemMessage(errno));
  }
}

void WriteTokenFile(const std::string& path, const std::string& text) {
  if (IsStandardStream(path)) {
    if (!WriteAll(STDOUT_FILENO, text) || !WriteAll(STDOUT_FILENO, "\n")) {
      FailToWrite("standard output", SystemMessage(errno));
    }
    return;
  }
  const DelayedSignals delayed;
  CheckDestination(path);
  NewFile file(path);
  file.Write(text);
  file.Rename();
}

}  // namespace SsoClient::Tool
