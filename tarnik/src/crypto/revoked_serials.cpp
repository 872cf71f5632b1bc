#include "crypto/revoked_serials.h"

#include <algorithm>
#include <limits>
#include <tuple>

#include <tarnik/crypto/crypto_exception.h>

#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

std::string SerialKey(bool isNegative, const unsigned char* bytes, std::size_t length) {
  std::string key(isNegative ? "-" : "+");
  const unsigned char* const end = bytes + length;
  key.append(std::find_if(bytes, end, [](unsigned char byte) { return byte != 0; }), end);
  return key;
}

}  // namespace

std::string SerialKeyOf(const ASN1_INTEGER* serial) {
  return SerialKey(ASN1_STRING_type(serial) == V_ASN1_NEG_INTEGER, ASN1_STRING_get0_data(serial),
                   static_cast<std::size_t>(ASN1_STRING_length(serial)));
}

std::string SerialKeyOf(const std::string& decimal) {
  const OpenSsl::ErrorScope errors;
  BIGNUM* raw = nullptr;
  if (BN_dec2bn(&raw, decimal.c_str()) == 0) {
    throw CryptoException(errors.Describe("The serial number cannot be read"));
  }
  const OpenSsl::OwnedBigNumber number(raw);
  std::vector<unsigned char> bytes(static_cast<std::size_t>(BN_num_bytes(raw)));
  BN_bn2bin(raw, bytes.data());
  return SerialKey(BN_is_negative(raw) == 1, bytes.data(), bytes.size());
}

void RevokedSerials::Add(std::string_view key, const System::DateTime& since) {
  if (keys_.size() + key.size() > std::numeric_limits<std::uint32_t>::max()) {
    throw CryptoException("The revocation list is too long.");
  }
  entries_.push_back({since.GetUtcTime(), static_cast<std::uint32_t>(keys_.size()),
                      static_cast<std::uint32_t>(key.size())});
  keys_ += key;
}

void RevokedSerials::Sort() {
  std::sort(entries_.begin(), entries_.end(), [this](const Entry& a, const Entry& b) {
    return std::make_tuple(KeyOf(a), a.microseconds) < std::make_tuple(KeyOf(b), b.microseconds);
  });
  keys_.shrink_to_fit();
  entries_.shrink_to_fit();
}

std::optional<System::DateTime> RevokedSerials::Since(std::string_view key) const {
  const auto place = std::lower_bound(
      entries_.begin(), entries_.end(), key,
      [this](const Entry& entry, std::string_view wanted) { return KeyOf(entry) < wanted; });
  if (place == entries_.end() || KeyOf(*place) != key) {
    return std::nullopt;
  }
  return System::DateTimeFromUtc(place->microseconds, false);
}

std::string_view RevokedSerials::KeyOf(const Entry& entry) const noexcept {
  return {keys_.data() + entry.place, entry.length};
}

}  // namespace Tarnik::Crypto
