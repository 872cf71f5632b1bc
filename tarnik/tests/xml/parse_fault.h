#ifndef TARNIK_TESTS_XML_PARSE_FAULT_H
#define TARNIK_TESTS_XML_PARSE_FAULT_H

#include <ostream>
#include <string>

#include <tarnik/xml/xml_parse_exception.h>

#include "support/thrown_message.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {

/// The message of the `XMLParseException` for `text`; empty if it is parsed.
inline std::string Fault(const std::string& text) {
  return ThrownMessage<Xml::XMLParseException>([&text] { ParseXml(text); }, "");
}

/// Text that the parser rejects, and the message of its exception.
struct FaultCase {
  const char* name;
  std::string text;
  std::string message;
};

inline void PrintTo(const FaultCase& fault, std::ostream* stream) {
  *stream << fault.name;
}

}  // namespace Tarnik::Testing

#endif
