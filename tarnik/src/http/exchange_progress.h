#ifndef TARNIK_HTTP_EXCHANGE_PROGRESS_H
#define TARNIK_HTTP_EXCHANGE_PROGRESS_H

#include <tarnik/http/bounded_user_agent.h>

namespace Tarnik::Http {

/// Implemented by the exchanges of this library. Thread-safe.
class ExchangeProgress {
 public:
  /// `kNone` when the exchange has ended.
  virtual ExchangeStage Stage() noexcept = 0;

 protected:
  ExchangeProgress() = default;
  ~ExchangeProgress() = default;
};

}  // namespace Tarnik::Http

#endif
