#include <tarnik/xml/xml_parse_exception.h>

namespace Tarnik::Xml {

XMLParseException::XMLParseException(const std::string& fault, const Position& position,
                                     const boost::source_location& where)
    : Exception(fault + " at line " + std::to_string(position.line) + ", column " +
                    std::to_string(position.column),
                where),
      position_(position) {}

XMLParseException::~XMLParseException() = default;

std::unique_ptr<Throwable> XMLParseException::Clone() const {
  return std::make_unique<XMLParseException>(*this);
}

void XMLParseException::Throw() const {
  throw *this;
}

}  // namespace Tarnik::Xml
