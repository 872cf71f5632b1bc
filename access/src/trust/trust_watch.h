#ifndef SSOCLIENT_ACCESS_TRUST_TRUST_WATCH_H
#define SSOCLIENT_ACCESS_TRUST_TRUST_WATCH_H

#include <atomic>
#include <chrono>
#include <memory>
#include <mutex>
#include <string>
#include <utility>

#include <ssoclient/access/trust_store.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/cancellable_item.h>

#include "activity.h"
#include "runtime.h"
#include "trust/trust_cell.h"
#include "trust/trust_files.h"

namespace SsoClient::Access {

/// What a store consists of in each process.
struct TrustParts {
  TrustParts(TrustStoreConfig ownConfig, std::shared_ptr<Runtime> ownRuntime,
             std::shared_ptr<const TrustState> state)
      : config(std::move(ownConfig)), runtime(std::move(ownRuntime)), cell(std::move(state)) {}

  TrustStoreConfig config;
  std::shared_ptr<Runtime> runtime;
  TrustCell cell;
};

/// Reads the files of a store in one process: when it is asked to, and when it sees that they have
/// changed. Thread-safe.
///
/// It looks at the metadata of the files with a timer and on a worker. The timer does not keep it
/// alive. Changed files are read when two looks in a row have found the same, or at the third look
/// that finds changes. Files that were read before two looks have found the same are read once
/// more, since a change within the resolution of the file system's clock leaves no trace.
class TrustWatch : public std::enable_shared_from_this<TrustWatch> {
 public:
  static constexpr std::chrono::milliseconds kPeriod{250};
  /// Changes are read at this look at the latest.
  static constexpr int kLatestLook = 3;

  explicit TrustWatch(std::shared_ptr<TrustParts> parts);
  TrustWatch(const TrustWatch&) = delete;
  TrustWatch& operator=(const TrustWatch&) = delete;

  /// As `TrustStore::Reload`. Throws `Tarnik::InvalidStateException` within the listener.
  void Reload();
  /// Begins to watch, unless it watches already. Without a timer, a later call tries again.
  void Begin() noexcept;
  bool IsWatching() const noexcept { return isArmed_.load(std::memory_order_acquire); }
  /// Ends the watch and waits up to `limit` until nothing of it runs, except on this thread. The
  /// listener is then released. Nothing is waited for while the process ends.
  void Stop(std::chrono::milliseconds limit);

 private:
  void Arm() noexcept;
  void SetTimer(Tarnik::Ref<Tarnik::System::CancellableItem> timer);
  void OnTimer() noexcept;
  void OnWorker() noexcept;
  void Look();
  void Read(bool isSettled);
  void ReadAll(TrustListing& listing);
  void Replace(std::shared_ptr<const Trust> trust);
  void Keep(const TrustListing& listing, const std::string& failure);
  void Report(const TrustRecord& record) noexcept;

  const std::shared_ptr<TrustParts> parts_;
  Activity activity_;
  std::mutex timerMutex_;
  Tarnik::Ref<Tarnik::System::CancellableItem> timer_;
  Instant::Steady nextLook_{};  // used by the chain of timers and looks

  // Held while files are read, and while the listener runs. A listing is empty until
  // there has been a look.
  std::mutex mutex_;
  TrustListing lastLook_;
  TrustListing settled_;         // read after two looks had found it
  TrustListing reported_;        // when the last failure was reported
  std::string reportedFailure_;  // empty after a success
  int looksWithChanges_ = 0;
  std::atomic<bool> isStopped_{false};
  std::atomic<bool> isArmed_{false};
};

}  // namespace SsoClient::Access

#endif
