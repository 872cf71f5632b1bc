#ifndef TARNIK_CORE_OBJECT_H
#define TARNIK_CORE_OBJECT_H

#include <string>

#include <tarnik/export.h>

namespace Tarnik {

/// Base class of all reference-counted objects of the platform. Held by `Ref<T>`; never deleted
/// directly.
///
/// Counting is thread-safe. The order of the virtual functions is part of the binary interface.
class TARNIK_EXPORT Object {
 public:
  Object() = default;
  Object(const Object&) = delete;
  Object& operator=(const Object&) = delete;

  /// Adds one reference.
  virtual void IncRef() const noexcept = 0;
  /// Removes one reference; the object is destroyed with its last one.
  virtual void DecRef() const noexcept = 0;
  /// A one-line description for diagnostics; never contains secrets.
  virtual std::string ToString() const = 0;
  /// The current number of references, for diagnostics; it may change at any time.
  virtual long RefCount() const noexcept = 0;

 protected:
  virtual ~Object() = default;

 public:
  /// Called when the first reference is taken. Does nothing unless overridden.
  virtual void OnFirstRef() const noexcept {}
  /// Called when the last reference has been removed, before destruction. Does nothing unless
  /// overridden.
  virtual void OnLastRef() const noexcept {}
};

/// For `Ref`: adds a reference.
inline void intrusive_ptr_add_ref(const Object* object) noexcept {
  object->IncRef();
}
/// For `Ref`: removes a reference.
inline void intrusive_ptr_release(const Object* object) noexcept {
  object->DecRef();
}

}  // namespace Tarnik

#endif
