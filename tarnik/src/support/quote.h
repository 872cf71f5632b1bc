#ifndef TARNIK_SUPPORT_QUOTE_H
#define TARNIK_SUPPORT_QUOTE_H

#include <string>
#include <string_view>

namespace Tarnik {

/// `text` from outside in the form for a message: between apostrophes, what is not printable ASCII
/// replaced with question marks, and cut after 120 bytes.
std::string Quote(std::string_view text);

}  // namespace Tarnik

#endif
