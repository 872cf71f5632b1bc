#ifndef SSOCLIENT_ACCESS_PER_PROCESS_H
#define SSOCLIENT_ACCESS_PER_PROCESS_H

#include <atomic>
#include <cstdint>
#include <memory>
#include <utility>

#include "process_hooks.h"

namespace SsoClient::Access {

/// An object for each process, which is made on first use. A forked child makes its own; the one of
/// its parent is never touched there, not even destroyed, since threads that the child does not
/// have may hold its locks. Thread-safe, apart from the destructor.
template <class T>
class PerProcess {
 public:
  PerProcess() = default;
  ~PerProcess() {
    Node* const node = node_.load(std::memory_order_acquire);
    if (node != nullptr && node->generation == ForkGeneration()) {
      delete node;
    }
  }
  PerProcess(const PerProcess&) = delete;
  PerProcess& operator=(const PerProcess&) = delete;

  /// The object of this process; null if it has not been made.
  T* Find() const noexcept {
    Node* const node = node_.load(std::memory_order_acquire);
    return node != nullptr && node->generation == ForkGeneration() ? &node->value : nullptr;
  }

  /// The object of this process, made with `make()` on first use. Of several that threads make
  /// at once, one is used and the others are destroyed.
  template <class Make>
  T& Get(const Make& make) const {
    if (T* const found = Find()) {
      return *found;
    }
    Node* known = node_.load(std::memory_order_acquire);
    auto made = std::unique_ptr<Node>(new Node{ForkGeneration(), known, make()});
    if (node_.compare_exchange_strong(known, made.get(), std::memory_order_acq_rel)) {
      return made.release()->value;
    }
    return known->value;
  }

 private:
  struct Node {
    std::uint64_t generation;
    const Node* inherited;  // unused, so that leak checkers find it
    T value;
  };

  mutable std::atomic<Node*> node_{nullptr};
};

}  // namespace SsoClient::Access

#endif
