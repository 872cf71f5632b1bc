#ifndef TARNIK_CORE_REF_H
#define TARNIK_CORE_REF_H

#include <utility>

#include <boost/smart_ptr/intrusive_ptr.hpp>

#include <tarnik/core/object.h>

namespace Tarnik {

/// A counted reference to a platform object.
template <class T>
using Ref = boost::intrusive_ptr<T>;

/// Creates a `T` and returns the first reference to it.
template <class T, class... Arguments>
Ref<T> MakeRef(Arguments&&... arguments) {
  return Ref<T>(new T(std::forward<Arguments>(arguments)...));
}

}  // namespace Tarnik

#endif
