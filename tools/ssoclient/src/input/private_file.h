#ifndef SSOCLIENT_TOOL_INPUT_PRIVATE_FILE_H
#define SSOCLIENT_TOOL_INPUT_PRIVATE_FILE_H

#include <cstddef>
#include <string>
#include <string_view>

#include <sys/stat.h>

#include "input/secret_text.h"

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// Adds --allow-open-files, which sets `mayBeOpen`, to the command.
void AddOpenFilesOption(CLI::App& command, bool& mayBeOpen);

/// A file whose content only this user may know.
struct PrivateFile {
  std::string path{};
  /// What the file contains, for messages: "token", for example. The kinds of failures begin with
  /// it: "token-file", and "token-file-open" for a file that others can use.
  std::string what{};
  std::size_t maxBytes = 0;
  /// Whether others may know this content and change it; null if they never may.
  bool (*isPublic)(std::string_view content) = nullptr;
  /// Whether others may read or change the file, whatever it contains.
  bool mayBeOpen = false;
};

/// The content of the file, which may be a pipe: it is opened once. Throws `ToolException` when it
/// cannot be read, is a folder or has more than `maxBytes`, and when other users may read or change
/// it (`ExposureOf`), unless `mayBeOpen` or the content is public.
SecretText ReadPrivateFile(const PrivateFile& file);

/// Throws as `ReadPrivateFile` does, for a file that a library reads afterwards; neither the size
/// nor the content counts.
void CheckPrivateFile(const PrivateFile& file);

/// How others can use a file.
enum class Exposure {
  kNone,
  kByOwner,  ///< its owner is another user, but not root
  kByMode,   ///< its group or others may read or write it
};

/// How others than `user` and root can use a file with this status.
Exposure ExposureOf(const struct stat& status, uid_t user);

/// Reads `descriptor` to its end or until there are more than `maxBytes`; `name` is for messages.
SecretText ReadDescriptor(int descriptor, const std::string& name, const std::string& what,
                          std::size_t maxBytes);

}  // namespace SsoClient::Tool

#endif
