#ifndef TARNIK_SYSTEM_FILE_H
#define TARNIK_SYSTEM_FILE_H

#include <cstdio>
#include <memory>
#include <string>
#include <string_view>

#include "support/sensitive_text.h"

namespace Tarnik::System {

struct CloseFile {
  void operator()(std::FILE* file) const noexcept { static_cast<void>(std::fclose(file)); }
};
using OwnedFile = std::unique_ptr<std::FILE, CloseFile>;

/// The file, opened for reading in a descriptor that child processes do not inherit. Null with
/// `errno` set when it cannot be opened.
OwnedFile OpenForReading(const std::string& path);

/// Appends the content of a file to `text` and leaves no other copy in memory. Throws `IOException`
/// when the file cannot be read or is longer than 16 MiB; `kind` names the purpose of the file
/// ("certificate") in the message.
void ReadFile(std::string_view kind, const std::string& path, SensitiveText& text);

}  // namespace Tarnik::System

#endif
