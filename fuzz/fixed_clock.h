#ifndef FUZZ_FIXED_CLOCK_H
#define FUZZ_FIXED_CLOCK_H

#include <string>

#include <tarnik/system/date_time.h>

namespace Fuzz {

/// Every UUID that the libraries generate after `FixClock`.
inline const std::string kFixedUuid = "00112233-4455-4677-8899-aabbccddeeff";

/// From now on the libraries' clock shows `now`, and their UUIDs are `kFixedUuid`.
void FixClock(const Tarnik::System::DateTime& now);

}  // namespace Fuzz

#endif
