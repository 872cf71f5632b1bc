#ifndef SSOCLIENT_ACCESS_TRUST_TRUST_FILES_H
#define SSOCLIENT_ACCESS_TRUST_TRUST_FILES_H

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include <ssoclient/access/trust_store.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/revocation_list.h>

namespace SsoClient::Access {

/// A file or folder at one moment, without its content. Two are equal if nothing can have changed,
/// as far as the system says.
struct FileState {
  std::string path;
  std::uint64_t device = 0;
  std::uint64_t inode = 0;
  std::uint64_t size = 0;
  std::uint64_t modified = 0;  ///< mtime, in nanoseconds; wraps, since it may be any year
  std::uint64_t changed = 0;   ///< ctime, in nanoseconds
  std::uint32_t mode = 0;
  int error = 0;  ///< why nothing else is known (errno); zero if it is

  friend bool operator==(const FileState&, const FileState&) = default;
};

/// What a configured path leads to.
struct PathState {
  FileState target;  ///< of a folder only its identity, since what is in it counts
  /// The file, or the files of the folder that count, in the order of their names.
  std::vector<FileState> files;

  friend bool operator==(const PathState&, const PathState&) = default;
};

/// All files of a store at one moment.
struct TrustListing {
  struct Entry {
    std::vector<PathState> certificates;
    std::vector<PathState> lists;
    std::vector<PathState> listSigners;

    friend bool operator==(const Entry&, const Entry&) = default;
  };
  std::vector<Entry> entries;

  friend bool operator==(const TrustListing&, const TrustListing&) = default;
};

/// Never throws for files: what cannot be looked at is part of the listing.
TrustListing ListFiles(const std::vector<TrustedIssuer>& issuers);

struct FileContent {
  std::string path;
  std::string bytes;
};

/// The contents of all files.
struct TrustContents {
  struct Entry {
    std::vector<FileContent> certificates;
    std::vector<FileContent> lists;
    std::vector<FileContent> listSigners;
  };
  std::vector<Entry> entries;
  /// Differs when any path or content does (SHA-256).
  std::string digest;
  /// False when a file had been replaced or changed after it was listed.
  bool isOfListing = true;
};

/// The largest file that is read.
inline constexpr std::uint64_t kLargestTrustFile = std::uint64_t{16} * 1024 * 1024;

/// Reads the files of `listing`. Throws `Tarnik::IOException` for the first one that cannot be
/// read, before it reads any if the listing says so, and `Tarnik::ResourceException` when the
/// system has too few descriptors or too little memory.
TrustContents ReadFiles(const TrustListing& listing);

/// Reads all files as they are at one moment: lists them before and after, and reads again when
/// anything has changed in between, or a file that was read is not the one that was listed.
/// `listing` is set also when this throws.
///
/// Throws as above, and `Tarnik::IOException` when the files do not stay the same for long enough.
TrustContents ReadUnchanged(const std::vector<TrustedIssuer>& issuers, TrustListing& listing);

/// The same for the files that are listed by `list`.
TrustContents ReadUnchanged(const std::function<TrustListing()>& list, TrustListing& listing);

}  // namespace SsoClient::Access

#endif
