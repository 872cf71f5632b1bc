#ifndef TARNIK_CRYPTO_DISTINGUISHED_NAME_H
#define TARNIK_CRYPTO_DISTINGUISHED_NAME_H

#include <cstddef>
#include <string_view>

#include "support/openssl.h"

namespace Tarnik::Crypto {

/// A distinguished name (RFC 5280, section 4.1.2.4), or no name. Immutable; thread-safe.
class DistinguishedName {
 public:
  /// Longer texts are not read.
  static constexpr std::size_t kMaxText = 8192;

  /// No name.
  DistinguishedName() = default;
  /// A copy of `name`. Throws `CryptoException` when memory runs out.
  explicit DistinguishedName(const X509_NAME* name);

  /// Reads the text of a name, its most specific part first: RFC 4514, what RFC 2253 and RFC 1779
  /// allowed (quoted values, semicolons, blanks around separators, the prefix "OID."), and what
  /// .NET writes (quotation marks that are doubled in quoted values, a reverse solidus that begins
  /// no escape). Returns no name for any other text, for an attribute type that is not known, and
  /// for the empty text. Never throws for a text; the work is linear in its length.
  static DistinguishedName FromText(std::string_view text);

  /// RFC 5280, section 7.1: types of strings, the case of ASCII letters, repeated blanks and the
  /// order within a multi-valued part do not matter. No name equals nothing, and neither does an
  /// empty one.
  bool Equals(const DistinguishedName& other) const noexcept;

 private:
  bool IsEmpty() const noexcept;

  OpenSsl::Owned<X509_NAME, X509_NAME_free> name_;
};

}  // namespace Tarnik::Crypto

#endif
