#ifndef TARNIK_CORE_COPY_EXCEPTION_H
#define TARNIK_CORE_COPY_EXCEPTION_H

#include <memory>

#include <tarnik/core/exception.h>

namespace Tarnik {

/// A copy of `exception` with its exact class, to be kept after a completion has returned.
inline std::shared_ptr<Exception> CopyException(const Exception& exception) {
  return std::dynamic_pointer_cast<Exception>(std::shared_ptr<Throwable>(exception.Clone()));
}

}  // namespace Tarnik

#endif
