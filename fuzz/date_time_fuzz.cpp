// What is read as a date-time prints as a text that reads back as the same instant.
#include <tarnik/core/exception.h>
#include <tarnik/system/date_time.h>

#include "input.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using Tarnik::System::DateTime;
  try {
    const DateTime time = DateTime::Parse(Fuzz::TextOf(data, size));
    Fuzz::Require(DateTime::Parse(time.ToString()) == time);
  } catch (const Tarnik::DateTimeFormatException&) {
  }
  return 0;
}
