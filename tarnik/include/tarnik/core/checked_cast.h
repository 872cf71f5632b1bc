#ifndef TARNIK_CORE_CHECKED_CAST_H
#define TARNIK_CORE_CHECKED_CAST_H

#include <tarnik/core/exception.h>
#include <tarnik/core/object.h>

namespace Tarnik {

/// `object` as a `T`. Throws `TypeMismatchException` when it is null or of another class.
template <class T>
T* CheckedCast(const Object* object) {
  if (auto* result = dynamic_cast<T*>(object)) {
    return result;
  }
  throw TypeMismatchException("The object is not of the expected class.");
}

/// The same for an object that may be changed.
template <class T>
T* CheckedCast(Object* object) {
  if (auto* result = dynamic_cast<T*>(object)) {
    return result;
  }
  throw TypeMismatchException("The object is not of the expected class.");
}

}  // namespace Tarnik

#endif
