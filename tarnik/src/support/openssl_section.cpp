#include "support/openssl_section.h"

#include <ctime>

#include <pthread.h>

#include "support/fork.h"

namespace Tarnik::OpenSsl {
namespace {

// Sections share the lock and a fork has it for itself. Sections that begin while a fork waits must
// wait too; otherwise it would wait as long as the sections of different threads overlap.
constexpr pthread_rwlock_t kUnlocked = PTHREAD_RWLOCK_WRITER_NONRECURSIVE_INITIALIZER_NP;
constinit pthread_rwlock_t sectionLock = kUnlocked;
constinit thread_local unsigned depth = 0;
// Written only by the thread that forks, between the first and the last hook.
constinit bool isForkExclusive = false;

constexpr time_t kForkLimitSeconds = 1;

void WaitForSections() noexcept {
  // A callback that OpenSSL runs may fork; its thread must not wait for itself.
  if (depth > 0) {
    isForkExclusive = false;
    return;
  }
  timespec limit{};
  clock_gettime(CLOCK_REALTIME, &limit);
  limit.tv_sec += kForkLimitSeconds;
  isForkExclusive = pthread_rwlock_timedwrlock(&sectionLock, &limit) == 0;
}

void ContinueSections() noexcept {
  if (isForkExclusive) {
    pthread_rwlock_unlock(&sectionLock);
  }
}

// The threads that were in sections do not exist in the child.
void StartAnew() noexcept {
  ContinueSections();
  sectionLock = kUnlocked;
  if (depth > 0) {
    pthread_rwlock_rdlock(&sectionLock);
  }
}

[[maybe_unused]] const bool kSectionsTakePartInFork =
    (SetForkHooks(ForkOrder::kOpenSsl, {&WaitForSections, &ContinueSections, &StartAnew}), true);

}  // namespace

Section::Section() noexcept {
  if (depth++ == 0) {
    pthread_rwlock_rdlock(&sectionLock);
  }
}

Section::~Section() {
  if (--depth == 0) {
    pthread_rwlock_unlock(&sectionLock);
  }
}

}  // namespace Tarnik::OpenSsl
