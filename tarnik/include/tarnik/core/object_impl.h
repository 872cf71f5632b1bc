#ifndef TARNIK_CORE_OBJECT_IMPL_H
#define TARNIK_CORE_OBJECT_IMPL_H

#include <atomic>
#include <string>

#include <tarnik/core/object.h>

namespace Tarnik {

/// Reference counting for implementations of platform interfaces.
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
  // Overridden here, since this class would otherwise have empty vtable slots where another base
  // class shares its vtable with the virtual base `Object` (Itanium C++ ABI, section 2.5.2).
  void OnFirstRef() const noexcept override;
  void OnLastRef() const noexcept override;

 protected:
  ObjectImpl() = default;
  ~ObjectImpl() override;

  /// Adds a reference unless the count is already zero; false if it is.
  bool IncRefIfAlive() const noexcept;

 private:
  mutable std::atomic<long> refCount_{0};
};

}  // namespace Tarnik

#endif
