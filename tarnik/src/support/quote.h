#ifndef TARNIK_SUPPORT_QUOTE_H
#define TARNIK_SUPPORT_QUOTE_H

#include <string>
#include <string_view>

namespace Tarnik {

/// `text` of a peer in the form for a message: between apostrophes, cut after 120 bytes, and with
/// question marks in place of bytes that are not printable ASCII.
std::string Quote(std::string_view text);

/// `text` between apostrophes, cut after 120 bytes and at the start of a character, otherwise
/// unchanged. For names in UTF-8 whose characters have been checked.
std::string QuoteVerbatim(std::string_view text);

}  // namespace Tarnik

#endif
