#ifndef TARNIK_SYSTEM_CANCELLABLE_ITEM_H
#define TARNIK_SYSTEM_CANCELLABLE_ITEM_H

#include <functional>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>

namespace Tarnik::System {

/// A handle to an operation under way that can be cancelled. Thread-safe.
class TARNIK_EXPORT CancellableItem : public virtual Object {
 public:
  /// Cancels the operation; true when it was cancelled. The operation's completion still runs, with
  /// a `CancelledException` unless the operation had already ended.
  virtual bool Cancel() = 0;
};

/// An item whose `Cancel` calls `cancel` every time. Throws `InvalidArgumentException` when
/// `cancel` is empty.
TARNIK_EXPORT Ref<CancellableItem> CreateCancellableItem(std::function<bool()> cancel);

}  // namespace Tarnik::System

#endif
