#include "crypto/object_identifier.h"

#include <cstddef>

#include <openssl/objects.h>

#include "support/ascii.h"
#include "support/openssl.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

constexpr std::size_t kMaxIdentifierText = 128;

}  // namespace

// OpenSSL also accepts other separators and leading zeros.
bool IsDottedIdentifier(std::string_view text) noexcept {
  if (text.size() > kMaxIdentifierText) {
    return false;
  }
  for (;;) {
    const std::size_t dot = text.find('.');
    const std::string_view number = text.substr(0, dot);
    if (!AreDigits(number) || (number.size() > 1 && number.front() == '0')) {
      return false;
    }
    if (dot == std::string_view::npos) {
      return true;
    }
    text.remove_prefix(dot + 1);
  }
}

std::string ObjectIdentifierOf(std::string_view dotted) {
  if (!IsDottedIdentifier(dotted)) {
    return {};
  }
  const OpenSsl::ErrorScope errors;
  const OpenSsl::Owned<ASN1_OBJECT, ASN1_OBJECT_free> object(
      OBJ_txt2obj(std::string(dotted).c_str(), 1));
  if (object == nullptr) {
    return {};
  }
  return {reinterpret_cast<const char*>(OBJ_get0_data(object.get())), OBJ_length(object.get())};
}

}  // namespace Tarnik::Crypto
