#include "support/openssl_error.h"

#include <openssl/err.h>

#include "support/openssl_init.h"

namespace Tarnik::OpenSsl {
namespace {

constexpr const char* kOutOfMemory = "not enough memory";

bool IsOutOfMemory(unsigned long error) noexcept {
  return ERR_GET_REASON(error) == ERR_R_MALLOC_FAILURE;
}

ErrorReport TakeReport() noexcept {
  ErrorReport report;
  while (const unsigned long error = ERR_get_error()) {
    report.cause = report.cause == 0 ? error : report.cause;
    report.isOutOfMemory = report.isOutOfMemory || IsOutOfMemory(error);
  }
  return report;
}

}  // namespace

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
  const char* reason = nullptr;
  if (before_ == 0 && TakeReport().isOutOfMemory) {
    reason = kOutOfMemory;
  } else if (error != 0 && error != before_) {
    reason = ReasonOf(error);
  }
  if (reason != nullptr) {
    text.append(": ").append(reason);
  }
  return text.append(".");
}

FreshErrors::FreshErrors() {
  Initialise();
  Saved saved{};
  const char* text = nullptr;
  int flags = 0;
  while ((saved.code =
              ERR_get_error_all(&saved.file, &saved.line, &saved.function, &text, &flags)) != 0) {
    saved.text = (flags & ERR_TXT_STRING) != 0 ? text : "";
    saved_.push_back(saved);
  }
}

FreshErrors::~FreshErrors() {
  ERR_clear_error();
  for (const Saved& saved : saved_) {
    ERR_new();
    ERR_set_debug(saved.file, saved.line, saved.function);
    ERR_set_error(ERR_GET_LIB(saved.code), ERR_GET_REASON(saved.code),
                  saved.text.empty() ? nullptr : "%s", saved.text.c_str());
  }
}

ErrorReport FreshErrors::Take() const noexcept {
  return TakeReport();
}

const char* ReasonOf(unsigned long error) noexcept {
  return IsOutOfMemory(error) ? kOutOfMemory : ERR_reason_error_string(error);
}

}  // namespace Tarnik::OpenSsl
