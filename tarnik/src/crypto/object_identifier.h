#ifndef TARNIK_CRYPTO_OBJECT_IDENTIFIER_H
#define TARNIK_CRYPTO_OBJECT_IDENTIFIER_H

#include <string>
#include <string_view>

namespace Tarnik::Crypto {

/// True for numbers without leading zeros that are separated by dots. The text is not longer than
/// object identifiers are.
bool IsDottedIdentifier(std::string_view text) noexcept;
/// An object identifier in dotted form as the content of its DER encoding (X.690, section 8.19).
/// Empty for any other text.
std::string ObjectIdentifierOf(std::string_view dotted);

}  // namespace Tarnik::Crypto

#endif
