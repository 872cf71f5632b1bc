#ifndef TARNIK_CRYPTO_LOAD_FILE_H
#define TARNIK_CRYPTO_LOAD_FILE_H

#include <string>
#include <string_view>

#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/private_key.h>

#include "support/file.h"
#include "support/sensitive_text.h"

namespace Tarnik::Crypto {

/// What `read(content, passphrase)` makes of a file. A `CryptoException` of its own names the file
/// as one that cannot be used; what `passphrase` throws passes through.
template <typename Read>
auto LoadFile(std::string_view kind, const std::string& path, const PassphraseCallback& passphrase,
              const Read& read) {
  SensitiveText text;
  ReadFile(kind, path, text);
  bool hasPassphraseFailed = false;
  PassphraseCallback observed;
  if (passphrase) {
    observed = [&] {
      hasPassphraseFailed = true;
      std::string answer = passphrase();
      hasPassphraseFailed = false;
      return answer;
    };
  }
  try {
    return read(text.Text(), observed);
  } catch (const CryptoException& error) {
    if (hasPassphraseFailed) {
      throw;
    }
    throw CryptoException("The " + std::string(kind) + " file '" + path +
                          "' cannot be used: " + error.Message());
  }
}

}  // namespace Tarnik::Crypto

#endif
