#include <algorithm>
#include <cstdint>
#include <cstdio>

#include <tarnik/text/print.h>

#include "support/ascii.h"

namespace Tarnik {
namespace {

std::string PointerText(const void* pointer) {
  char text[2 + 2 * sizeof(std::uintptr_t) + 1];
  const int length =
      std::snprintf(text, sizeof text, "0x%jx",
                    static_cast<std::uintmax_t>(reinterpret_cast<std::uintptr_t>(pointer)));
  return {text, static_cast<std::size_t>(length)};
}

std::string DateText(const System::DateTime& time) {
  const auto fields = System::DateTimeFromUtc(time.GetUtcTime(), false).GetFields();
  char text[40];
  const int length = std::snprintf(text, sizeof text, "%02d%02d-%02d-%02d %02d:%02d:%02d.%03d UTC",
                                   fields.century, fields.yearOfCentury, fields.month, fields.day,
                                   fields.hour, fields.minute, fields.second, fields.millisecond);
  return {text, static_cast<std::size_t>(length)};
}

struct Placeholder {
  std::size_t number = 0;
  std::size_t length = 0;
};

// Reads the number of an argument at the start of `text`; 0 if `text` does not start with a digit.
Placeholder ReadPlaceholder(std::string_view text, std::size_t argumentCount) {
  Placeholder result;
  while (result.length < text.size() && IsDigit(text[result.length])) {
    const std::size_t number =
        result.number * 10 + static_cast<std::size_t>(text[result.length] - '0');
    if (number > argumentCount) {
      break;
    }
    result.number = number;
    ++result.length;
  }
  return result;
}

}  // namespace

PrintFormatter::PrintFormatter(const void* pointer) : text_(PointerText(pointer)) {}

DatePrintFormatter::DatePrintFormatter(const System::DateTime& time)
    : PrintFormatter(DateText(time)) {}

namespace Detail {

std::string ASPrintInternal(std::string_view format,
                            std::initializer_list<PrintFormatter> arguments) {
  std::string result;
  std::size_t position = 0;
  while (position < format.size()) {
    const std::size_t percent = std::min(format.find('%', position), format.size());
    result.append(format.substr(position, percent - position));
    if (percent == format.size()) {
      break;
    }
    const auto placeholder = ReadPlaceholder(format.substr(percent + 1), arguments.size());
    if (placeholder.number == 0) {
      result.push_back('%');
      position = percent + 1;
      continue;
    }
    result.append(arguments.begin()[placeholder.number - 1].Text());
    position = percent + 1 + placeholder.length;
  }
  return result;
}

}  // namespace Detail
}  // namespace Tarnik
