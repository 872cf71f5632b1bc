#include "crypto/x509_values.h"

#include <chrono>
#include <cstddef>
#include <ctime>

namespace Tarnik::Crypto {
namespace {

// RFC 2253, section 2.4 allows unescaped UTF-8, which other programs write. Escaped bytes would
// never match their names.
constexpr unsigned long kNameFlags =
    XN_FLAG_RFC2253 & ~static_cast<unsigned long>(ASN1_STRFLGS_ESC_MSB);

}  // namespace

std::optional<std::string> TextOfName(const X509_NAME* name) {
  const OpenSsl::OwnedBio memory(BIO_new(BIO_s_mem()));
  if (memory == nullptr || X509_NAME_print_ex(memory.get(), name, 0, kNameFlags) < 0) {
    return std::nullopt;
  }
  char* text = nullptr;
  const long length = BIO_get_mem_data(memory.get(), &text);
  return length > 0 ? std::string(text, static_cast<std::size_t>(length)) : std::string();
}

std::optional<System::DateTime> InstantOf(const ASN1_TIME* time) {
  std::tm fields{};
  // ASN1_TIME_to_tm returns the current time for null.
  if (time == nullptr || ASN1_TIME_to_tm(time, &fields) != 1) {
    return std::nullopt;
  }
  using namespace std::chrono;
  const auto date =
      year_month_day(year(fields.tm_year + 1900), month(static_cast<unsigned>(fields.tm_mon + 1)),
                     day(static_cast<unsigned>(fields.tm_mday)));
  const auto instant =
      sys_days(date) + hours(fields.tm_hour) + minutes(fields.tm_min) + seconds(fields.tm_sec);
  return System::DateTimeFromUtc(duration_cast<microseconds>(instant.time_since_epoch()).count(),
                                 false);
}

}  // namespace Tarnik::Crypto
