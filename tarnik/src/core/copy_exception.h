#ifndef TARNIK_CORE_COPY_EXCEPTION_H
#define TARNIK_CORE_COPY_EXCEPTION_H

#include <memory>
#include <new>

#include <tarnik/core/exception.h>

namespace Tarnik {

/// A copy of `exception` with its exact class, to be kept after a completion has returned; or
/// `OutOfMemory()` when there is no memory for the copy.
inline std::shared_ptr<Exception> CopyException(const Exception& exception) noexcept {
  try {
    return std::dynamic_pointer_cast<Exception>(std::shared_ptr<Throwable>(exception.Clone()));
  } catch (const std::bad_alloc&) {
    // The alias has no owner, so it allocates nothing.
    return {std::shared_ptr<Exception>(), const_cast<ResourceException*>(&OutOfMemory())};
  }
}

}  // namespace Tarnik

#endif
