#ifndef TARNIK_CRYPTO_DISTINGUISHED_NAME_READER_H
#define TARNIK_CRYPTO_DISTINGUISHED_NAME_READER_H

#include <string>
#include <string_view>

namespace Tarnik::Crypto {

/// No usual name has more attributes, and one of many would take long to build.
inline constexpr int kMaxNameAttributes = 64;

/// The DER encoding of the name that `text` is in one of the forms of
/// `DistinguishedName::FromText`; empty when the text has another form or too
/// many attributes. Values in hexadecimal form
/// are copied, so that the result may be invalid.
std::string DerOfNameText(std::string_view text);

}  // namespace Tarnik::Crypto

#endif
