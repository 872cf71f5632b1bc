#ifndef TARNIK_SYSTEM_CANCELLABLE_ITEM_H
#define TARNIK_SYSTEM_CANCELLABLE_ITEM_H

#include <functional>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>

namespace Tarnik::System {

/// A handle to something under way that can be called off. Safe from any thread.
class TARNIK_EXPORT CancellableItem : public virtual Object {
 public:
  /// Calls it off; true when the cancellation was carried out. The operation's completion still
  /// runs, with a `CancelledException` unless it had already ended.
  virtual bool Cancel() = 0;
};

/// An item whose `Cancel` runs `cancel`, each time that it is called.
TARNIK_EXPORT Ref<CancellableItem> CreateCancellableItem(std::function<bool()> cancel);

}  // namespace Tarnik::System

#endif
