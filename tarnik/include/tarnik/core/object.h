#ifndef TARNIK_CORE_OBJECT_H
#define TARNIK_CORE_OBJECT_H

#include <string>

#include <tarnik/export.h>

namespace Tarnik {

/// Root of every reference-counted object of the platform. Held by `Ref<T>`; never deleted
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
  /// Drops one reference; the object dies with its last one.
  virtual void DecRef() const noexcept = 0;
  /// A one-line description for diagnostics; never holds secrets.
  virtual std::string ToString() const = 0;
  /// The number of references at this moment; a diagnostic, stale as soon as it is read.
  virtual long RefCount() const noexcept = 0;

 protected:
  virtual ~Object() = default;

 public:
  /// Called when the first reference is taken. Does nothing unless overridden.
  virtual void OnFirstRef() const noexcept {}
  /// Called when the last reference has gone, before destruction. Does nothing unless overridden.
  virtual void OnLastRef() const noexcept {}
};

inline void intrusive_ptr_add_ref(const Object* object) noexcept {
  object->IncRef();
}
inline void intrusive_ptr_release(const Object* object) noexcept {
  object->DecRef();
}

}  // namespace Tarnik

#endif
