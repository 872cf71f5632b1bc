#include "xml/xml_date_time.h"

#include <cstddef>

namespace SsoClient {

namespace {

void AppendPadded(std::string& text, int value, std::size_t width) {
  const std::string digits = std::to_string(value);
  if (digits.size() < width) {
    text.append(width - digits.size(), '0');
  }
  text += digits;
}

}  // namespace

std::string FormatXmlDateTime(const Tarnik::System::DateTime& time) {
  const auto fields = time.GetFields();
  std::string text;
  AppendPadded(text, fields.century * 100 + fields.yearOfCentury, 4);
  text += '-';
  AppendPadded(text, fields.month, 2);
  text += '-';
  AppendPadded(text, fields.day, 2);
  text += 'T';
  AppendPadded(text, fields.hour, 2);
  text += ':';
  AppendPadded(text, fields.minute, 2);
  text += ':';
  AppendPadded(text, fields.second, 2);
  text += '.';
  AppendPadded(text, fields.millisecond, 3);
  text += time.ToShortStringBias();
  return text;
}

Tarnik::System::DateTime AddMinutes(const Tarnik::System::DateTime& time, std::uint32_t minutes) {
  constexpr std::uint32_t kMicrosecondsPerMinute = 60'000'000;
  // The unsigned product wraps where a signed one would be undefined; C++20 defines the conversion.
  const auto distance = static_cast<std::int32_t>(minutes * kMicrosecondsPerMinute);
  return Tarnik::System::DateTimeFromUtc(Tarnik::System::SaturatingAdd(time.GetUtcTime(), distance),
                                         false);
}

void AddCreatedAndExpires(XMLCompositeBuilder& element, const Tarnik::System::DateTime& created,
                          const Tarnik::System::DateTime& expires) {
  element.Add(MakeTextElementBuilder("wsu", "Created", FormatXmlDateTime(created)))
      .Add(MakeTextElementBuilder("wsu", "Expires", FormatXmlDateTime(expires)));
}

}  // namespace SsoClient
