#ifndef TARNIK_SUPPORT_FORK_H
#define TARNIK_SUPPORT_FORK_H

#include <cstddef>
#include <utility>

namespace Tarnik {

/// The modules that take part in a `fork`, in the order in which their locks are acquired before
/// it. A thread that holds a lock of one module may acquire locks of later ones only.
enum class ForkOrder : unsigned char { kLog, kOpenSsl, kThreadPool, kObjects, kSockets, kWaits };
inline constexpr std::size_t kForkOrderCount = 6;

/// What a module does around a `fork`; called on the thread that forks. `prepare` acquires the
/// module's locks, and the other two release them. `child` also removes what belongs to the
/// parent's threads. It may only use what is async-signal-safe and the memory of the module.
struct ForkHooks {
  void (*prepare)() noexcept;
  void (*parent)() noexcept;
  void (*child)() noexcept;
};

/// Registers the hooks of a module. Called while the library is loaded. `vfork` and `posix_spawn`
/// do not run hooks.
void SetForkHooks(ForkOrder module, const ForkHooks& hooks) noexcept;

/// Changes in every forked child: 0 in the process that loaded the library, 1 in its children, and
/// so on.
unsigned ForkGeneration() noexcept;

/// Remembers in which process an object was made.
class ForkMark {
 public:
  ForkMark() noexcept : generation_(ForkGeneration()) {}
  /// True in a child that was forked later. The threads that the object works with exist only in
  /// the parent, and one of them may have held the object's lock.
  bool IsFromParent() const noexcept { return generation_ != ForkGeneration(); }

 private:
  unsigned generation_;
};

/// Contains a `T` that works with threads or descriptors of its process. A child that was forked
/// later does not destroy it, since that would wait for the parent's threads.
template <class T>
class ForkBound {
 public:
  template <class... Arguments>
  explicit ForkBound(Arguments&&... arguments) : object_(std::forward<Arguments>(arguments)...) {}
  ~ForkBound() {
    if (!mark_.IsFromParent()) {
      object_.~T();
    }
  }
  ForkBound(const ForkBound&) = delete;
  ForkBound& operator=(const ForkBound&) = delete;

  bool IsFromParent() const noexcept { return mark_.IsFromParent(); }
  T* operator->() noexcept { return &object_; }
  T& operator*() noexcept { return object_; }

 private:
  // A member of a union is destroyed only explicitly.
  union {
    T object_;
  };
  ForkMark mark_;
};

}  // namespace Tarnik

#endif
