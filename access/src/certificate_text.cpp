#include "certificate_text.h"

#include <cstddef>

namespace SsoClient::Access {

std::string ShortFingerprint(const Tarnik::Crypto::Certificate& certificate) {
  constexpr std::size_t kShown = 8 * 3 - 1;  // pairs of digits with colons between them
  return Tarnik::Crypto::FingerprintText(certificate).substr(0, kShown) + "...";
}

}  // namespace SsoClient::Access
