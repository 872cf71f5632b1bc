#ifndef TARNIK_CRYPTO_LOAD_FILE_H
#define TARNIK_CRYPTO_LOAD_FILE_H

#include <string>
#include <string_view>

#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/private_key.h>

#include "support/sensitive_text.h"
#include "system/file.h"

namespace Tarnik::Crypto {

/// Returns `read(content, passphrase)` for the content of a file. A `CryptoException` of `read` is
/// rethrown with the name of the file; what `passphrase` throws passes through unchanged.
template <typename Read>
auto LoadFile(std::string_view kind, const std::string& path, const PassphraseCallback& passphrase,
              const Read& read) {
  SensitiveText text;
  System::ReadFile(kind, path, text);
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
