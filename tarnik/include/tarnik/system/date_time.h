#ifndef TARNIK_SYSTEM_DATE_TIME_H
#define TARNIK_SYSTEM_DATE_TIME_H

#include <string>
#include <string_view>

#include <tarnik/export.h>

namespace Tarnik::System {

/// An instant on the UTC time line in microseconds since 1970-01-01T00:00:00Z, with the UTC offset
/// of the zone of its calendar fields. An immutable value; comparisons use only the instant.
///
/// The range is 0001-01-01T00:00:00.000000Z to 9999-12-31T23:59:59.999999Z, the years that XML
/// Schema dateTime writes in four digits; instants outside of it are clamped to it.
class TARNIK_EXPORT DateTime {
 public:
  /// 1970-01-01T00:00:00Z.
  DateTime() = default;

  /// Reads the XML Schema dateTime form (XML Schema Part 2, section 3.2.7):
  /// "YYYY-MM-DDThh:mm:ss[.fraction][Z|(+|-)hh:mm]".
  ///
  /// A time without a zone is UTC (SAML 2.0 core, section 1.3.3). Digits of the fraction after the
  /// sixth are ignored. 24:00:00 is midnight of the next day. Throws `DateTimeFormatException` for
  /// years before 0001 or after 9999, leap seconds, zones beyond 14:00, lower-case letters, white
  /// space, and anything else that is not of this form.
  static DateTime Parse(std::string_view text);

  /// Microseconds since 1970-01-01T00:00:00Z.
  long GetUtcTime() const noexcept { return utcMicroseconds_; }
  /// The minutes by which the zone of the calendar fields is ahead of UTC, -840 to 840.
  int Bias() const noexcept { return biasMinutes_; }

  /// The calendar fields (proleptic Gregorian) in the zone of this value.
  struct Fields {
    int century;        ///< 0 to 99: the year divided by 100
    int yearOfCentury;  ///< 0 to 99
    int month;          ///< 1 to 12
    int day;            ///< 1 to 31
    int hour;           ///< 0 to 23
    int minute;         ///< 0 to 59
    int second;         ///< 0 to 59
    int millisecond;    ///< 0 to 999
    int microsecond;    ///< 0 to 999, within the millisecond
  };
  /// The fields of this value.
  Fields GetFields() const noexcept;

  /// "2024-03-05T07:08:09.010Z"; microseconds are added when they are not zero
  /// ("2024-03-05T07:08:09.010007Z").
  std::string ToString() const;

  /// The zone designator: "Z" for UTC, else "+hh:mm" or "-hh:mm".
  std::string ToShortStringBias() const;

  /// Values are compared as instants: the zones of their fields do not matter.
  friend bool operator==(const DateTime& a, const DateTime& b) noexcept {
    return a.utcMicroseconds_ == b.utcMicroseconds_;
  }
  /// Different instants.
  friend bool operator!=(const DateTime& a, const DateTime& b) noexcept { return !(a == b); }
  /// True when `a` is before `b`.
  friend bool operator<(const DateTime& a, const DateTime& b) noexcept {
    return a.utcMicroseconds_ < b.utcMicroseconds_;
  }
  /// True when `a` is after `b`.
  friend bool operator>(const DateTime& a, const DateTime& b) noexcept { return b < a; }
  /// True unless `a` is after `b`.
  friend bool operator<=(const DateTime& a, const DateTime& b) noexcept { return !(b < a); }
  /// True unless `a` is before `b`.
  friend bool operator>=(const DateTime& a, const DateTime& b) noexcept { return !(a < b); }

 private:
  friend TARNIK_EXPORT DateTime DateTimeFromUtc(long utcMicroseconds, bool inLocalZone);
  DateTime(long utcMicroseconds, int biasMinutes) noexcept;

  long utcMicroseconds_ = 0;
  int biasMinutes_ = 0;
};

/// The instant `utcMicroseconds` after 1970-01-01T00:00:00Z, with its fields in UTC, or in the
/// process's local zone if `inLocalZone`.
TARNIK_EXPORT DateTime DateTimeFromUtc(long utcMicroseconds, bool inLocalZone);

/// The current time of the system clock, with its fields in UTC.
TARNIK_EXPORT DateTime GetUtcDateTime();

/// The sum, limited to the 64-bit range instead of overflowing.
TARNIK_EXPORT long SaturatingAdd(long a, long b) noexcept;
/// The product, limited in the same way.
TARNIK_EXPORT long SaturatingMultiply(long a, long b) noexcept;

}  // namespace Tarnik::System

#endif
