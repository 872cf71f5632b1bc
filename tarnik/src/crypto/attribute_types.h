#ifndef TARNIK_CRYPTO_ATTRIBUTE_TYPES_H
#define TARNIK_CRYPTO_ATTRIBUTE_TYPES_H

#include <string>
#include <string_view>

namespace Tarnik::Crypto {

/// The object identifier of an attribute type in the text of a distinguished name, as the content
/// of its DER encoding. Empty for a type that is not known. The type is a dotted object identifier,
/// with or without the prefix "OID.", or a name. Known are the names that RFC 1779, RFC 4514, RFC
/// 4519 and other programs use, in any letter case, and OpenSSL's names as OpenSSL writes them.
std::string AttributeTypeOf(std::string_view text);

}  // namespace Tarnik::Crypto

#endif
