#ifndef TARNIK_SYSTEM_HANDLER_MEMORY_H
#define TARNIK_SYSTEM_HANDLER_MEMORY_H

#include <atomic>
#include <cstddef>
#include <new>
#include <type_traits>
#include <utility>

#include "system/pool_thread.h"

namespace Tarnik::System {

/// Memory for one handler of Asio at a time, as a member of the object that starts the operation:
/// an operation whose handler fits allocates nothing, and so cannot fail for want of memory. While
/// the memory is in use, and for larger handlers, `Allocate` takes memory from the heap.
///
/// Asio frees the memory of a handler before it calls it, so that a handler may start the next
/// operation in the same memory. `Allocate` and `Deallocate` may run on different threads, also
/// concurrently. The object must live until the memory was freed: a handler that holds a reference
/// to the object ensures that.
class HandlerMemory {
 public:
  /// Sufficient for the operations of sockets and timers, and for posts, with handlers of up to
  /// `kMaxHandlerSize` bytes.
  static constexpr std::size_t kSize = 256;
  static constexpr std::size_t kMaxHandlerSize = 48;

  HandlerMemory() = default;
  HandlerMemory(const HandlerMemory&) = delete;
  HandlerMemory& operator=(const HandlerMemory&) = delete;

  void* Allocate(std::size_t size) {
    if (size <= kSize && !isUsed_.exchange(true, std::memory_order_acquire)) {
      return storage_;
    }
    return ::operator new(size);
  }

  void Deallocate(void* memory) noexcept {
    if (memory == storage_) {
      isUsed_.store(false, std::memory_order_release);
      return;
    }
    ::operator delete(memory);
  }

 private:
  alignas(std::max_align_t) std::byte storage_[kSize];
  std::atomic<bool> isUsed_{false};
};

/// A standard allocator over a `HandlerMemory`.
template <class T>
class HandlerAllocator {
 public:
  using value_type = T;

  explicit HandlerAllocator(HandlerMemory& memory) noexcept : memory_(&memory) {}
  template <class U>
  // NOLINTNEXTLINE(google-explicit-constructor): allocators convert when they are rebound.
  HandlerAllocator(const HandlerAllocator<U>& other) noexcept : memory_(other.memory_) {}

  T* allocate(std::size_t count) {
    static_assert(alignof(T) <= alignof(std::max_align_t));
    return static_cast<T*>(memory_->Allocate(count * sizeof(T)));
  }
  void deallocate(T* object, std::size_t) noexcept { memory_->Deallocate(object); }

  template <class U>
  bool operator==(const HandlerAllocator<U>& other) const noexcept {
    return memory_ == other.memory_;
  }

 private:
  template <class U>
  friend class HandlerAllocator;

  HandlerMemory* memory_;
};

/// A handler that runs in a `CompletionScope`, and whose associated allocator is over a
/// `HandlerMemory`.
template <class Handler>
class HandlerWithMemory {
 public:
  using allocator_type = HandlerAllocator<void>;

  static_assert(sizeof(Handler) <= HandlerMemory::kMaxHandlerSize);
  static_assert(std::is_nothrow_move_constructible_v<Handler>);

  HandlerWithMemory(HandlerMemory& memory, Handler handler) noexcept
      : memory_(&memory), handler_(std::move(handler)) {}

  allocator_type get_allocator() const noexcept { return allocator_type(*memory_); }

  template <class... Arguments>
  void operator()(Arguments&&... arguments) {
    const CompletionScope scope;
    handler_(std::forward<Arguments>(arguments)...);
  }

 private:
  HandlerMemory* memory_;
  Handler handler_;
};

/// `handler`, with `memory` for the operation that it is passed to.
template <class Handler>
auto WithMemory(HandlerMemory& memory, Handler&& handler) {
  return HandlerWithMemory<std::decay_t<Handler>>(memory, std::forward<Handler>(handler));
}

}  // namespace Tarnik::System

#endif
