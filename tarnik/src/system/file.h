#ifndef TARNIK_SYSTEM_FILE_H
#define TARNIK_SYSTEM_FILE_H

#include <string>
#include <string_view>

#include "support/sensitive_text.h"

namespace Tarnik::System {

/// Appends the content of a file to `text` and leaves no other copy in memory. Throws `IOException`
/// when the file cannot be read or is longer than 16 MiB; `kind` names the purpose of the file
/// ("certificate") in the message.
void ReadFile(std::string_view kind, const std::string& path, SensitiveText& text);

}  // namespace Tarnik::System

#endif
