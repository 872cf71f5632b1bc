#include "crypto/distinguished_name.h"

#include <string>

#include <tarnik/crypto/crypto_exception.h>

#include "crypto/distinguished_name_reader.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {

DistinguishedName::DistinguishedName(const X509_NAME* name) {
  const OpenSsl::ErrorScope errors;
  name_.reset(X509_NAME_dup(name));
  if (name_ == nullptr) {
    throw CryptoException(errors.Describe("A distinguished name cannot be copied"));
  }
}

DistinguishedName DistinguishedName::FromText(std::string_view text) {
  DistinguishedName read;
  if (text.size() > kMaxText) {
    return read;
  }
  const std::string der = DerOfNameText(text);
  if (der.empty()) {
    return read;
  }
  // OpenSSL checks what the text has in hexadecimal form, and that strings are UTF-8.
  const OpenSsl::ErrorScope errors;
  const auto* position = reinterpret_cast<const unsigned char*>(der.data());
  read.name_.reset(d2i_X509_NAME(nullptr, &position, static_cast<long>(der.size())));
  return read;
}

bool DistinguishedName::IsEmpty() const noexcept {
  return name_ == nullptr || X509_NAME_entry_count(name_.get()) == 0;
}

bool DistinguishedName::Equals(const DistinguishedName& other) const noexcept {
  return !IsEmpty() && !other.IsEmpty() && X509_NAME_cmp(name_.get(), other.name_.get()) == 0;
}

}  // namespace Tarnik::Crypto
