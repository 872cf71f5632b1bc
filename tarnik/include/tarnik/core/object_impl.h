#ifndef TARNIK_CORE_OBJECT_IMPL_H
#define TARNIK_CORE_OBJECT_IMPL_H

#include <atomic>
#include <string>

#include <tarnik/core/object.h>

namespace Tarnik {

/// The reference count that implementations of platform interfaces inherit.
///
/// `Object` is a virtual base, so that a class may combine one or more interfaces with this one:
/// `class MyResolver : public KeyInfoResolver, public ObjectImpl`.
class TARNIK_EXPORT ObjectImpl : public virtual Object {
 public:
  void IncRef() const noexcept override;
  void DecRef() const noexcept override;
  /// "<ClassName>" unless overridden.
  std::string ToString() const override;
  long RefCount() const noexcept override;
  // Without overriders of its own, this class would have empty slots wherever another base of the
  // object has claimed the shared `Object` (Itanium C++ ABI, section 2.5.2).
  void OnFirstRef() const noexcept override;
  void OnLastRef() const noexcept override;

 protected:
  ObjectImpl() = default;
  ~ObjectImpl() override;

  /// Takes a reference unless the count has already fallen to zero; false if it has.
  bool IncRefIfAlive() const noexcept;

 private:
  mutable std::atomic<long> refCount_{0};
};

}  // namespace Tarnik

#endif
