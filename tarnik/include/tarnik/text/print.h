#ifndef TARNIK_TEXT_PRINT_H
#define TARNIK_TEXT_PRINT_H

#include <initializer_list>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>

#include <tarnik/export.h>
#include <tarnik/system/date_time.h>

namespace Tarnik {

/// One argument of a format. Its value is converted to text by the constructor.
///
/// Booleans print as "true" and "false", integers in decimal, pointers in hexadecimal after "0x",
/// date-times in their `DateTime::ToString` form, and texts unchanged.
class TARNIK_EXPORT PrintFormatter {
 public:
  /// A text.
  PrintFormatter(std::string text) : text_(std::move(text)) {}
  /// A text, which is copied.
  PrintFormatter(std::string_view text) : text_(text) {}
  /// A text that ends in a NUL, which is copied. Not null.
  PrintFormatter(const char* text) : text_(text) {}
  /// A date-time.
  PrintFormatter(const System::DateTime& time) : text_(time.ToString()) {}
  /// A pointer.
  PrintFormatter(const void* pointer);
  /// An integer or a boolean.
  template <class Integer, std::enable_if_t<std::is_integral_v<Integer>, int> = 0>
  PrintFormatter(Integer value) {
    if constexpr (std::is_same_v<Integer, bool>) {
      text_ = value ? "true" : "false";
    } else {
      text_ = std::to_string(value);
    }
  }

  /// The text of the value.
  const std::string& Text() const noexcept { return text_; }

 private:
  std::string text_;
};

/// A date-time in a readable form: "2024-03-05 07:08:09.010 UTC", milliseconds always shown.
class TARNIK_EXPORT DatePrintFormatter : public PrintFormatter {
 public:
  /// Formats `time`.
  explicit DatePrintFormatter(const System::DateTime& time);
};

namespace Detail {

/// Returns `format` with each "%N" (N from 1) replaced by argument N. Arguments are not scanned for
/// placeholders. A percent sign that is not followed by the number of an argument is kept.
TARNIK_EXPORT std::string ASPrintInternal(std::string_view format,
                                          std::initializer_list<PrintFormatter> arguments);

}  // namespace Detail
}  // namespace Tarnik

#endif
