#ifndef DEVSTS_SOAP_ELEMENT_READER_H
#define DEVSTS_SOAP_ELEMENT_READER_H

#include <libxml/tree.h>

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

#include "xml/schema_values.h"

namespace DevSts {

// An attribute that an element may have.
struct AttributeName {
  const char* name;
  const char* namespaceUri = nullptr;
};

// Reads the children of one element in the order that its schema gives. Whatever does not fit is an
// InvalidRequest fault that names the place.
class ElementReader {
 public:
  // Character data between the children may be white space only.
  explicit ElementReader(xmlNode* element);

  // The next child, which must have this name.
  xmlNode* Expect(const char* namespaceUri, const char* localName);
  // The next child if it has this name, else null.
  xmlNode* Optional(const char* namespaceUri, const char* localName);
  bool AtEnd() const { return next_ == children_.size(); }
  // Nothing may follow.
  void End() const;

 private:
  xmlNode* element_;
  std::vector<xmlNode*> children_;
  std::size_t next_ = 0;
};

// Every attribute must be one of these and each of these must be there.
void RequireAttributes(const xmlNode* element, const std::vector<AttributeName>& names);
// Text of an element that has neither child elements nor attributes.
std::string PlainText(const xmlNode* element);
// Text of an element without child elements; its attributes are the caller's business.
std::string TextOf(const xmlNode* element);
// PlainText that must be this: anything else is "Unsupported", by the element's name.
void RequireText(const xmlNode* element, const std::string& expected);
// The same for wst:RequestType, which says what the SOAPAction said.
void RequireRequestType(const xmlNode* element, const std::string& expected);
// "true" or "false" in an element of plain text or an attribute.
bool BooleanOf(const std::string& text, const std::string& place);
// wsu:Created and wsu:Expires of a Timestamp or Lifetime.
std::pair<Time, Time> ReadPeriod(xmlNode* element);

}  // namespace DevSts

#endif
