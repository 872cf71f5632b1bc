#include "support/object_lock.h"

#include <array>
#include <cstddef>
#include <cstdint>

#include "support/fork.h"

namespace Tarnik {
namespace {

// A fork holds all of them. ThreadSanitizer ends a process in which a thread holds 64 locks.
constexpr std::size_t kLocks = 16;
constexpr std::size_t kCacheLineBytes = 64;

struct alignas(kCacheLineBytes) PaddedMutex {
  std::mutex mutex;
};

// A `std::mutex` has a constant initialiser and a trivial destructor, so the locks work from load
// to exit.
constinit std::array<PaddedMutex, kLocks> locks{};

void LockAll() noexcept {
  for (PaddedMutex& each : locks) {
    each.mutex.lock();
  }
}

void UnlockAll() noexcept {
  for (PaddedMutex& each : locks) {
    each.mutex.unlock();
  }
}

[[maybe_unused]] const bool kObjectLocksTakePartInFork =
    (SetForkHooks(ForkOrder::kObjects, {&LockAll, &UnlockAll, &UnlockAll}), true);

}  // namespace

std::mutex& ObjectLock(const void* object) noexcept {
  // Fibonacci hashing: the lowest bits of addresses are mostly equal.
  constexpr std::uint64_t kFactor = 0x9E3779B97F4A7C15;
  const auto hash = static_cast<std::uint64_t>(reinterpret_cast<std::uintptr_t>(object)) * kFactor;
  return locks[hash >> 60].mutex;
}

}  // namespace Tarnik
