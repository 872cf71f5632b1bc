// A date-time can be read exactly when the model reads it, as the same instant. It is also an
// xs:dateTime to libxml2, which orders two of them in the same way. Printed and read again, it is
// the same instant.
#include <memory>
#include <optional>

#include <libxml/xmlschemastypes.h>

#include <tarnik/core/exception.h>
#include <tarnik/system/date_time.h>

#include "input.h"
#include "value_model.h"

namespace {

using Tarnik::System::DateTime;

std::optional<DateTime> Read(const std::string& text) {
  try {
    return DateTime::Parse(text);
  } catch (const Tarnik::DateTimeFormatException&) {
    return std::nullopt;
  }
}

struct FreeValue {
  void operator()(xmlSchemaVal* value) const { xmlSchemaFreeValue(value); }
};
using Value = std::unique_ptr<xmlSchemaVal, FreeValue>;

Value ReadByLibXml2(const std::string& text) {
  static xmlSchemaType* const type = [] {
    xmlSchemaInitTypes();
    return xmlSchemaGetBuiltInType(XML_SCHEMAS_DATETIME);
  }();
  xmlSchemaVal* value = nullptr;
  const auto* characters = reinterpret_cast<const xmlChar*>(text.c_str());
  return xmlSchemaValPredefTypeNodeNoNorm(type, characters, &value, nullptr) == 0 ? Value(value)
                                                                                  : nullptr;
}

// To libxml2, a time without a zone may be in any zone, and seconds are floating-point numbers.
bool IsComparable(const std::string& text) {
  const std::size_t point = text.find('.');
  const std::size_t digits =
      point == std::string::npos ? 0 : text.find_first_not_of("0123456789", point + 1) - point - 1;
  return digits <= 6 && text.find_first_of("Z+", 10) != std::string::npos;
}

void Compare(const DateTime& a, const std::string& aText, const DateTime& b,
             const std::string& bText) {
  if (!IsComparable(aText) || !IsComparable(bText)) {
    return;
  }
  const int order = xmlSchemaCompareValues(ReadByLibXml2(aText).get(), ReadByLibXml2(bText).get());
  Fuzz::Require(order == (a < b ? -1 : a == b ? 0 : 1));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text = Fuzz::TextOf(data, size);
  const std::string first = text.substr(0, text.find('\n'));
  const auto time = Read(first);
  const auto model = Fuzz::DateOf(first);
  Fuzz::Require(time.has_value() == model.has_value());
  Fuzz::Require(!time || time->GetUtcTime() == *model);
  if (!time) {
    return 0;
  }
  Fuzz::Require(Read(time->ToString()) == time);
  Fuzz::Require(ReadByLibXml2(first) != nullptr);
  if (first.size() == text.size()) {
    return 0;
  }
  const std::string second = text.substr(first.size() + 1);
  if (const auto other = Read(second)) {
    Compare(*time, first, *other, second);
  }
  return 0;
}
