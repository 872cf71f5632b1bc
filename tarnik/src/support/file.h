#ifndef TARNIK_SUPPORT_FILE_H
#define TARNIK_SUPPORT_FILE_H

#include <string>
#include <string_view>

#include "support/sensitive_text.h"

namespace Tarnik {

/// Appends the content of a file to `text`; no other copy is left in memory. Throws `IOException`,
/// in which `kind` says what the file is for ("certificate"), when it cannot be read or is longer
/// than 16 MiB.
void ReadFile(std::string_view kind, const std::string& path, SensitiveText& text);

}  // namespace Tarnik

#endif
