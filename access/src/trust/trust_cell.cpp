#include "trust/trust_cell.h"

#include <chrono>
#include <mutex>
#include <utility>

#include <pthread.h>

namespace SsoClient::Access {

namespace {

// Of the cells of all stores, so that it can be held during a fork. It is held only while a pointer
// is copied.
std::mutex cellMutex;

[[maybe_unused]] const bool kCellsTakePartInFork =
    pthread_atfork([]() noexcept { cellMutex.lock(); }, []() noexcept { cellMutex.unlock(); },
                   []() noexcept { cellMutex.unlock(); }) == 0;

}  // namespace

std::shared_ptr<const TrustState> MakeTrustState(std::shared_ptr<const Trust> trust,
                                                 Instant::Wall loadedAt) {
  const auto sinceEpoch =
      std::chrono::duration_cast<std::chrono::microseconds>(loadedAt.time_since_epoch());
  return std::make_shared<const TrustState>(
      TrustState{std::move(trust), Tarnik::System::DateTimeFromUtc(sinceEpoch.count(), false), {}});
}

TrustCell::TrustCell(std::shared_ptr<const TrustState> state) noexcept
    : state_(std::move(state)), version_(state_->trust->snapshot.Version()) {}

std::shared_ptr<const TrustState> TrustCell::Get() const {
  const std::lock_guard lock(cellMutex);
  return state_;
}

void TrustCell::Set(std::shared_ptr<const TrustState> state) {
  const std::uint64_t version = state->trust->snapshot.Version();
  {
    const std::lock_guard lock(cellMutex);
    state_.swap(state);
    version_.store(version, std::memory_order_release);
  }
  // The previous state is destroyed here, without the lock.
}

}  // namespace SsoClient::Access
