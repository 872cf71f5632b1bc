#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/system/cancellable_item.h>

namespace Tarnik::System {
namespace {

class CancellableItemImpl final : public CancellableItem, public ObjectImpl {
 public:
  explicit CancellableItemImpl(std::function<bool()> cancel) : cancel_(std::move(cancel)) {}

  bool Cancel() override { return cancel_(); }
  std::string ToString() const override { return "<CancellableItem>"; }

 private:
  const std::function<bool()> cancel_;
};

}  // namespace

Ref<CancellableItem> CreateCancellableItem(std::function<bool()> cancel) {
  if (!cancel) {
    throw InvalidArgumentException("A cancellable item needs a function that cancels it.");
  }
  return MakeRef<CancellableItemImpl>(std::move(cancel));
}

}  // namespace Tarnik::System
