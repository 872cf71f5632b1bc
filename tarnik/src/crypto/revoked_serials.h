#ifndef TARNIK_CRYPTO_REVOKED_SERIALS_H
#define TARNIK_CRYPTO_REVOKED_SERIALS_H

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <tarnik/system/date_time.h>

#include "support/openssl.h"

namespace Tarnik::Crypto {

/// A serial number in the one form in which serial numbers are compared: its sign and its bytes.
std::string SerialKeyOf(const ASN1_INTEGER* serial);
/// The same of a decimal number. Throws `CryptoException` when memory runs out.
std::string SerialKeyOf(const std::string& decimal);

/// Serial numbers with the times since when they are revoked. A list may have hundreds of thousands
/// of them, so they have no allocations of their own.
class RevokedSerials {
 public:
  /// Throws `CryptoException` when there is no more room, after gigabytes.
  void Add(std::string_view key, const System::DateTime& since);
  /// Called once, before `Since`.
  void Sort();
  /// Since when the serial number is revoked: the earliest time that was added.
  std::optional<System::DateTime> Since(std::string_view key) const;

 private:
  struct Entry {
    std::int64_t microseconds;  // since 1970
    std::uint32_t place;        // in `keys_`
    std::uint32_t length;
  };

  std::string_view KeyOf(const Entry& entry) const noexcept;

  std::string keys_;
  std::vector<Entry> entries_;
};

}  // namespace Tarnik::Crypto

#endif
