#ifndef TARNIK_HTTP_EXCHANGE_PROGRESS_H
#define TARNIK_HTTP_EXCHANGE_PROGRESS_H

#include <tarnik/http/bounded_user_agent.h>
#include <tarnik/system/cancellable_item.h>

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

/// What an exchange without a connection is waiting for. `connect` may be null.
ExchangeStage ConnectStageOf(const System::CancellableItem* connect) noexcept;

/// The stage in messages of time-outs.
const char* Describe(ExchangeStage stage) noexcept;

}  // namespace Tarnik::Http

#endif
