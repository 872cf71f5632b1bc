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
  const char* file = nullptr;
  const char* function = nullptr;
  const char* text = nullptr;
  int line = 0;
  int flags = 0;
  while (const unsigned long code = ERR_get_error_all(&file, &line, &function, &text, &flags)) {
    // Copied, since the queue owns the texts.
    saved_.push_back({code, file, line, function, (flags & ERR_TXT_STRING) != 0 ? text : ""});
  }
}

FreshErrors::~FreshErrors() {
  ERR_clear_error();
  for (const Saved& saved : saved_) {
    ERR_new();
    ERR_set_debug(saved.file.c_str(), saved.line, saved.function.c_str());
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
