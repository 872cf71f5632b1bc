#include "operations/secrets.h"

#include <openssl/crypto.h>

namespace DevSts {

bool IsSameSecret(const std::string& left, const std::string& right) {
  return left.size() == right.size() && CRYPTO_memcmp(left.data(), right.data(), left.size()) == 0;
}

}  // namespace DevSts
