#ifndef SSOCLIENT_ACCESS_RUNTIME_H
#define SSOCLIENT_ACCESS_RUNTIME_H

#include <functional>
#include <memory>

#include <tarnik/core/ref.h>
#include <tarnik/system/cancellable_item.h>

#include "instant.h"

namespace SsoClient::Access {

/// Time, chance and threads, which tests replace. Thread-safe.
class Runtime {
 public:
  virtual ~Runtime() = default;

  virtual Instant Now() const = 0;
  /// Random, at least 0 and below 1.
  virtual double Draw() = 0;
  /// Runs `work`, which may block, on a worker thread. Throws `Tarnik::ResourceException`.
  virtual void Run(std::function<void()> work) = 0;
  /// Runs `action`, which must not block, at `time` unless the returned item is cancelled first.
  virtual Tarnik::Ref<Tarnik::System::CancellableItem> RunAt(Instant::Steady time,
                                                             std::function<void()> action) = 0;
};

/// The clocks of the system, its random numbers, and the pool of the platform.
std::shared_ptr<Runtime> CreateSystemRuntime();

}  // namespace SsoClient::Access

#endif
