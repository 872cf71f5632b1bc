#include <tarnik/version.h>

namespace Tarnik {

const char* Version() noexcept {
  return TARNIK_VERSION;
}

}  // namespace Tarnik
