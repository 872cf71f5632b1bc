#ifndef TARNIK_XML_XML_PARSE_EXCEPTION_H
#define TARNIK_XML_XML_PARSE_EXCEPTION_H

#include <memory>
#include <string>

#include <tarnik/core/exception.h>
#include <tarnik/xml/xml_parser.h>

namespace Tarnik::Xml {

/// A document that was rejected. The message ends with " at line L, column C".
class TARNIK_EXPORT XMLParseException : public Exception {
 public:
  /// The message is `fault` with the position.
  XMLParseException(const std::string& fault, const Position& position,
                    const boost::source_location& where = CurrentLocation());
  ~XMLParseException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;

  /// The line of the fault, counted from 1.
  unsigned long Line() const noexcept { return position_.line; }
  /// Its column in bytes, counted from 1.
  unsigned long Column() const noexcept { return position_.column; }

 private:
  Position position_;
};

}  // namespace Tarnik::Xml

#endif
