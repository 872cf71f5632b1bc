#include "fixed_clock.h"

#include <optional>

namespace {

std::optional<Tarnik::System::DateTime> fixedNow;

}  // namespace

namespace Fuzz {

void FixClock(const Tarnik::System::DateTime& now) {
  fixedNow = now;
}

// The linker's option --wrap passes the libraries' calls to these functions, and calls of the real
// ones to the libraries.
Tarnik::System::DateTime RealNow() __asm__("__real__ZN6Tarnik6System14GetUtcDateTimeEv");
Tarnik::System::DateTime Now() __asm__("__wrap__ZN6Tarnik6System14GetUtcDateTimeEv");
std::string RealUuid() __asm__("__real__ZN6Tarnik10StringUtil12GenerateUuidB5cxx11Ev");
std::string Uuid() __asm__("__wrap__ZN6Tarnik10StringUtil12GenerateUuidB5cxx11Ev");

Tarnik::System::DateTime Now() {
  return fixedNow ? *fixedNow : RealNow();
}

std::string Uuid() {
  return fixedNow ? kFixedUuid : RealUuid();
}

}  // namespace Fuzz
