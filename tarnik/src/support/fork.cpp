#include "support/fork.h"

#include <array>
#include <atomic>

#include <pthread.h>

namespace Tarnik {
namespace {

// Constant-initialised, since modules register themselves while static objects are constructed.
constinit std::array<ForkHooks, kForkOrderCount> hooks{};
constinit std::atomic<unsigned> generation{0};
constinit std::atomic<bool> isRegistered{false};

void Prepare() noexcept {
  for (const ForkHooks& module : hooks) {
    if (module.prepare != nullptr) {
      module.prepare();
    }
  }
}

void ContinueParent() noexcept {
  for (auto module = hooks.rbegin(); module != hooks.rend(); ++module) {
    if (module->parent != nullptr) {
      module->parent();
    }
  }
}

void ContinueChild() noexcept {
  generation.fetch_add(1, std::memory_order_relaxed);
  for (auto module = hooks.rbegin(); module != hooks.rend(); ++module) {
    if (module->child != nullptr) {
      module->child();
    }
  }
}

}  // namespace

void SetForkHooks(ForkOrder module, const ForkHooks& given) noexcept {
  hooks[static_cast<std::size_t>(module)] = given;
  if (!isRegistered.exchange(true)) {
    // It fails only for lack of memory while the library is loaded; then a child must call `exec`,
    // as before.
    static_cast<void>(pthread_atfork(&Prepare, &ContinueParent, &ContinueChild));
  }
}

unsigned ForkGeneration() noexcept {
  return generation.load(std::memory_order_relaxed);
}

}  // namespace Tarnik
