#ifndef TARNIK_CORE_WEAK_LINKABLE_IMPL_H
#define TARNIK_CORE_WEAK_LINKABLE_IMPL_H

#include <functional>
#include <memory>
#include <mutex>
#include <utility>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>

namespace Tarnik {

/// A reference that does not keep its object alive. Copies refer to the same object.
/// Filled by `WeakLinkableImpl::AttachWeakRef`; safe to use from any thread.
class WeakRef {
 public:
  /// The object, or null if it has been destroyed or none was attached.
  Ref<const Object> Lock() const { return state_ == nullptr ? nullptr : state_->Lock(); }

 private:
  template <class Base>
  friend class WeakLinkableImpl;

  class State {
   public:
    explicit State(std::function<Ref<const Object>()> promote) : promote_(std::move(promote)) {}

    Ref<const Object> Lock() {
      const std::lock_guard<std::mutex> guard(mutex_);
      return promote_ ? promote_() : nullptr;
    }

    void Clear() {
      const std::lock_guard<std::mutex> guard(mutex_);
      promote_ = nullptr;
    }

   private:
    std::mutex mutex_;
    std::function<Ref<const Object>()> promote_;
  };

  std::shared_ptr<State> state_;
};

/// Adds weak references to a reference-counted base class. `AttachWeakRef` and `HasLink` extend the
/// vtable of `Base` in this order.
template <class Base>
class WeakLinkableImpl : public Base {
 public:
  /// As `Base`; weak references turn null before the object is destroyed.
  void DecRef() const noexcept override { Base::DecRef(); }

  /// Makes `weakRef` refer to this object.
  virtual void AttachWeakRef(WeakRef& weakRef) const {
    const std::lock_guard<std::mutex> guard(mutex_);
    if (state_ == nullptr) {
      state_ = std::make_shared<WeakRef::State>([this]() -> Ref<const Object> {
        return this->IncRefIfAlive() ? Ref<const Object>(this, false) : nullptr;
      });
    }
    weakRef.state_ = state_;
  }

  /// True once a weak reference has been attached.
  virtual bool HasLink() const {
    const std::lock_guard<std::mutex> guard(mutex_);
    return state_ != nullptr;
  }

 protected:
  using Base::Base;
  ~WeakLinkableImpl() override {
    if (state_ != nullptr) {
      state_->Clear();
    }
  }

 private:
  mutable std::mutex mutex_;
  mutable std::shared_ptr<WeakRef::State> state_;
};

}  // namespace Tarnik

#endif
