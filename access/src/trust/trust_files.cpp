#include "trust/trust_files.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <memory>
#include <string_view>
#include <system_error>
#include <utility>

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/digest.h>

namespace SsoClient::Access {

namespace {

constexpr int kReadings = 5;

enum class Content { kCertificates, kLists };

struct FolderDeleter {
  void operator()(DIR* folder) const noexcept { closedir(folder); }
};

class Descriptor {
 public:
  explicit Descriptor(int number) noexcept : number_(number) {}
  ~Descriptor() {
    if (number_ >= 0) {
      close(number_);
    }
  }
  Descriptor(const Descriptor&) = delete;
  Descriptor& operator=(const Descriptor&) = delete;

  int Number() const noexcept { return number_; }

 private:
  int number_;
};

bool IsShortage(int error) noexcept {
  return error == EMFILE || error == ENFILE || error == ENOMEM;
}

[[noreturn]] void ThrowFileError(const std::string& path, int error) {
  const std::string message = "The trust file '" + path +
                              "' cannot be read: " + std::generic_category().message(error) + ".";
  if (IsShortage(error)) {
    throw Tarnik::ResourceException(message);
  }
  throw Tarnik::IOException(message);
}

[[noreturn]] void ThrowUnfit(const std::string& path, std::string_view why) {
  throw Tarnik::IOException("The trust file '" + path + "' cannot be read: " + std::string(why));
}

std::uint64_t ToNanoseconds(const timespec& time) noexcept {
  return static_cast<std::uint64_t>(time.tv_sec) * 1'000'000'000 +
         static_cast<std::uint64_t>(time.tv_nsec);
}

FileState StateOf(std::string path, const struct stat& found) {
  FileState state;
  state.path = std::move(path);
  state.device = found.st_dev;
  state.inode = found.st_ino;
  state.mode = found.st_mode;
  if (!S_ISDIR(found.st_mode)) {
    state.size = static_cast<std::uint64_t>(found.st_size);
    state.modified = ToNanoseconds(found.st_mtim);
    state.changed = ToNanoseconds(found.st_ctim);
  }
  return state;
}

FileState Look(std::string path) {
  struct stat found {};
  if (stat(path.c_str(), &found) == 0) {
    return StateOf(std::move(path), found);
  }
  FileState state;
  state.error = errno;
  state.path = std::move(path);
  return state;
}

bool Counts(std::string_view name, Content content) noexcept {
  if (name.empty() || name.front() == '.') {
    return false;
  }
  const auto endsIn = [name](std::string_view end) { return name.ends_with(end); };
  return endsIn(".pem") || endsIn(".crt") || endsIn(".cer") ||
         (content == Content::kLists && endsIn(".crl"));
}

// Returns an error (errno) or zero.
int ListNames(const std::string& path, Content content, std::vector<std::string>& names) {
  const std::unique_ptr<DIR, FolderDeleter> folder(opendir(path.c_str()));
  if (folder == nullptr) {
    return errno;
  }
  for (;;) {
    errno = 0;
    const dirent* const entry = readdir(folder.get());
    if (entry == nullptr) {
      break;
    }
    if (Counts(entry->d_name, content)) {
      names.emplace_back(entry->d_name);
    }
  }
  const int error = errno;
  std::sort(names.begin(), names.end());
  return error;
}

PathState LookAtPath(const std::string& path, Content content) {
  PathState state;
  state.target = Look(path);
  if (state.target.error != 0) {
    return state;
  }
  if (!S_ISDIR(state.target.mode)) {
    state.files.push_back(state.target);
    return state;
  }
  std::vector<std::string> names;
  state.target.error = ListNames(path, content, names);
  for (const std::string& name : names) {
    std::string file = path;
    file.append("/").append(name);
    state.files.push_back(Look(file));
  }
  return state;
}

std::vector<PathState> LookAtPaths(const std::vector<std::string>& paths, Content content) {
  std::vector<PathState> states;
  states.reserve(paths.size());
  for (const std::string& path : paths) {
    states.push_back(LookAtPath(path, content));
  }
  return states;
}

void RequireReadable(const std::vector<PathState>& paths) {
  for (const PathState& path : paths) {
    if (path.target.error != 0) {
      ThrowFileError(path.target.path, path.target.error);
    }
    for (const FileState& file : path.files) {
      if (file.error != 0) {
        ThrowFileError(file.path, file.error);
      }
      if (!S_ISREG(file.mode)) {
        ThrowUnfit(file.path, "it is not a regular file.");
      }
      if (file.size > kLargestTrustFile) {
        ThrowUnfit(file.path, "it is longer than 16 MiB.");
      }
    }
  }
}

// Sets `isListed` to false when the file is not the one of `listed`.
std::string ReadContent(const FileState& listed, bool& isListed) {
  const std::string& path = listed.path;
  // A pipe or a device that has taken the place of the file must not block.
  const Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
  struct stat found {};
  if (file.Number() < 0 || fstat(file.Number(), &found) != 0) {
    ThrowFileError(path, errno);
  }
  if (!S_ISREG(found.st_mode)) {
    ThrowUnfit(path, "it is not a regular file.");
  }
  isListed = isListed && StateOf(path, found) == listed;
  std::string bytes;
  std::array<char, 16384> buffer;
  for (;;) {
    const ssize_t count = read(file.Number(), buffer.data(), buffer.size());
    if (count == 0) {
      return bytes;
    }
    if (count < 0 && errno != EINTR) {
      ThrowFileError(path, errno);
    }
    if (count > 0) {
      bytes.append(buffer.data(), static_cast<std::size_t>(count));
    }
    if (bytes.size() > kLargestTrustFile) {
      ThrowUnfit(path, "it is longer than 16 MiB.");
    }
  }
}

// Collects the contents of a store, with the texts that its digest is made of.
class ContentReader {
 public:
  std::vector<FileContent> Read(const std::vector<PathState>& paths) {
    std::vector<FileContent> contents;
    for (const PathState& path : paths) {
      for (const FileState& file : path.files) {
        contents.push_back({file.path, ReadContent(file, isOfListing_)});
        Add(contents.back().path);
        Add(contents.back().bytes);
      }
    }
    // Between the parts of an entry, so that a file in another part differs.
    identity_ += '|';
    return contents;
  }

  bool IsOfListing() const noexcept { return isOfListing_; }

  std::string Digest() const {
    const auto digest = Tarnik::Crypto::Sha256(identity_);
    return std::string(digest.begin(), digest.end());
  }

 private:
  void Add(std::string_view bytes) {
    const auto digest = Tarnik::Crypto::Sha256(bytes);
    identity_ += '.';
    identity_.append(digest.begin(), digest.end());
  }

  std::string identity_;
  bool isOfListing_ = true;
};

}  // namespace

TrustListing ListFiles(const std::vector<TrustedIssuer>& issuers) {
  TrustListing listing;
  listing.entries.reserve(issuers.size());
  for (const TrustedIssuer& issuer : issuers) {
    listing.entries.push_back({LookAtPaths(issuer.certificatePaths, Content::kCertificates),
                               LookAtPaths(issuer.revocationListPaths, Content::kLists),
                               LookAtPaths(issuer.listSignerPaths, Content::kCertificates)});
  }
  return listing;
}

TrustContents ReadFiles(const TrustListing& listing) {
  for (const TrustListing::Entry& entry : listing.entries) {
    RequireReadable(entry.certificates);
    RequireReadable(entry.lists);
    RequireReadable(entry.listSigners);
  }
  TrustContents contents;
  ContentReader reader;
  for (const TrustListing::Entry& entry : listing.entries) {
    TrustContents::Entry& read = contents.entries.emplace_back();
    read.certificates = reader.Read(entry.certificates);
    read.lists = reader.Read(entry.lists);
    read.listSigners = reader.Read(entry.listSigners);
  }
  contents.digest = reader.Digest();
  contents.isOfListing = reader.IsOfListing();
  return contents;
}

TrustContents ReadUnchanged(const std::vector<TrustedIssuer>& issuers, TrustListing& listing) {
  return ReadUnchanged([&issuers] { return ListFiles(issuers); }, listing);
}

TrustContents ReadUnchanged(const std::function<TrustListing()>& list, TrustListing& listing) {
  listing = list();
  for (int reading = 0; reading < kReadings; ++reading) {
    TrustContents contents;
    std::unique_ptr<Tarnik::Throwable> failure;
    try {
      contents = ReadFiles(listing);
    } catch (const Tarnik::IOException& error) {
      failure = error.Clone();
    }
    TrustListing after = list();
    // A folder may have been replaced by another one and put back in between.
    if (after == listing && (failure != nullptr || contents.isOfListing)) {
      if (failure != nullptr) {
        failure->Throw();
      }
      return contents;
    }
    listing = std::move(after);
  }
  throw Tarnik::IOException("The trust files change faster than they can be read.");
}

}  // namespace SsoClient::Access
