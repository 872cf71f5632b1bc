#include "crypto/passphrase.h"

#include <algorithm>
#include <cstddef>

#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/text/string_util.h>

namespace Tarnik::Crypto {
namespace {

// PEM_BUFSIZE of OpenSSL, the size of its callbacks' buffer.
constexpr std::size_t kMaxPassphraseBytes = 1024;

/// The text that the callback returned, cleansed also when it is rejected.
struct CallbackResult {
  std::string text;
  ~CallbackResult() { StringUtil::Cleanse(text); }
};

}  // namespace

Passphrase::~Passphrase() {
  StringUtil::Cleanse(text_);
}

const std::string& Passphrase::Get() {
  wasNeeded_ = true;
  if (failure_ != nullptr) {
    std::rethrow_exception(failure_);
  }
  if (!isKnown_) {
    try {
      Ask();
    } catch (...) {
      // The callback runs at most once.
      failure_ = std::current_exception();
      throw;
    }
  }
  return text_;
}

void Passphrase::Ask() {
  if (!callback_) {
    throw CryptoException("The private key needs a passphrase, and none was given.");
  }
  const CallbackResult result{callback_()};
  if (result.text.size() > kMaxPassphraseBytes) {
    throw CryptoException("The passphrase is longer than " + std::to_string(kMaxPassphraseBytes) +
                          " bytes.");
  }
  // Copied, since moving a short text would leave its bytes in the moved-from string.
  text_ = result.text;
  isKnown_ = true;
}

int Passphrase::Read(char* buffer, int size, int /*forWriting*/, void* passphrase) noexcept {
  try {
    const std::string& text = static_cast<Passphrase*>(passphrase)->Get();
    if (size < 0 || text.size() > static_cast<std::size_t>(size)) {
      return -1;
    }
    std::copy(text.begin(), text.end(), buffer);
    return static_cast<int>(text.size());
  } catch (...) {
    return -1;
  }
}

void Passphrase::RethrowFailure() const {
  if (failure_ != nullptr) {
    std::rethrow_exception(failure_);
  }
}

}  // namespace Tarnik::Crypto
