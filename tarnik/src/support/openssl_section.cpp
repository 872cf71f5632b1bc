#include "support/openssl_section.h"

#include <array>
#include <atomic>
#include <cstddef>
#include <ctime>

#include <pthread.h>

#include "support/fork.h"

namespace Tarnik::OpenSsl {
namespace {

constexpr std::size_t kSlots = 16;
constexpr time_t kForkLimitSeconds = 1;

// Threads share a few locks, so that they do not all write to one cache line. A section holds the
// lock of its thread's slot together with others, a fork has all of them for itself. Sections that
// begin while a fork waits must wait too; otherwise it would wait as long as sections overlap.
struct alignas(64) Slot {
  pthread_rwlock_t lock = PTHREAD_RWLOCK_WRITER_NONRECURSIVE_INITIALIZER_NP;
  // Written only by a thread that forks, between the first and the last hook. The locks of the log,
  // which are acquired first, keep other threads from forking meanwhile.
  bool isHeldByFork = false;
};

constinit std::array<Slot, kSlots> slots{};
constinit std::atomic<std::size_t> lastThread{0};
constinit thread_local unsigned depth = 0;
constinit thread_local Slot* slotOfThread = nullptr;

Slot& SlotOfThread() noexcept {
  if (slotOfThread == nullptr) {
    slotOfThread = &slots[lastThread.fetch_add(1, std::memory_order_relaxed) % kSlots];
  }
  return *slotOfThread;
}

void WaitForSections() noexcept {
  timespec limit{};
  clock_gettime(CLOCK_MONOTONIC, &limit);
  limit.tv_sec += kForkLimitSeconds;
  for (Slot& slot : slots) {
    // A callback that OpenSSL runs may fork; its thread must not wait for itself.
    const bool isOwn = depth > 0 && &slot == slotOfThread;
    slot.isHeldByFork =
        !isOwn && pthread_rwlock_clockwrlock(&slot.lock, CLOCK_MONOTONIC, &limit) == 0;
  }
}

void ContinueSections() noexcept {
  for (Slot& slot : slots) {
    if (slot.isHeldByFork) {
      pthread_rwlock_unlock(&slot.lock);
    }
  }
}

// The threads that were in sections do not exist in the child.
void StartSectionsAnew() noexcept {
  slots = {};
  if (depth > 0) {
    pthread_rwlock_rdlock(&slotOfThread->lock);
  }
}

[[maybe_unused]] const bool kSectionsTakePartInFork =
    (SetForkHooks(ForkOrder::kOpenSsl, {&WaitForSections, &ContinueSections, &StartSectionsAnew}),
     true);

}  // namespace

Section::Section() noexcept {
  if (depth++ == 0) {
    pthread_rwlock_rdlock(&SlotOfThread().lock);
  }
}

Section::~Section() {
  if (--depth == 0) {
    pthread_rwlock_unlock(&slotOfThread->lock);
  }
}

}  // namespace Tarnik::OpenSsl
