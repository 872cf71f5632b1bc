#include "support/openssl_error.h"

#include <openssl/err.h>

#include "support/openssl_init.h"

namespace Tarnik::OpenSsl {

ErrorScope::ErrorScope() noexcept {
  Initialise();
  before_ = ERR_peek_last_error();
  ERR_set_mark();
}

// An empty queue cannot be marked. Without a mark ERR_pop_to_mark empties the queue, which restores
// it as well.
ErrorScope::~ErrorScope() {
  ERR_pop_to_mark();
}

std::string ErrorScope::Describe(std::string_view what) const {
  std::string text(what);
  const unsigned long error = ERR_peek_last_error();
  const char* reason = error == 0 || error == before_ ? nullptr : ERR_reason_error_string(error);
  if (reason != nullptr) {
    text.append(": ").append(reason);
  }
  return text.append(".");
}

}  // namespace Tarnik::OpenSsl
