#ifndef DEVSTS_SOAP_ELEMENT_READER_H
#define DEVSTS_SOAP_ELEMENT_READER_H

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

#include <libxml/tree.h>

#include "xml/schema_values.h"

namespace DevSts {

// An attribute that an element may have.
struct AttributeName {
  const char* name;
  const char* namespaceUri = nullptr;
};

// Reads the children of one element in the order of its schema. Throws an InvalidRequest fault that
// names the place of the first mismatch.
class ElementReader {
 public:
  // Throws if there is text other than white space between the children.
  explicit ElementReader(xmlNode* element);

  // The next child, which must have this name.
  xmlNode* Expect(const char* namespaceUri, const char* localName);
  // The next child if it has this name, else null.
  xmlNode* Optional(const char* namespaceUri, const char* localName);
  bool AtEnd() const { return next_ == children_.size(); }
  // Throws if there are more children.
  void End() const;

 private:
  xmlNode* element_;
  std::vector<xmlNode*> children_;
  std::size_t next_ = 0;
};

// Throws unless the element has exactly these attributes.
void RequireAttributes(const xmlNode* element, const std::vector<AttributeName>& names);
// The text of an element, which must have neither child elements nor attributes.
std::string PlainText(const xmlNode* element);
// The text of an element, which must not have child elements; attributes are not checked.
std::string TextOf(const xmlNode* element);
// Throws unless PlainText(element) is the expected text: "Unsupported" and the element's name.
void RequireText(const xmlNode* element, const std::string& expected);
// The same for wst:RequestType, which must match the SOAPAction.
void RequireRequestType(const xmlNode* element, const std::string& expected);
// The value of "true" or "false"; `place` names the element or attribute in the fault.
bool BooleanOf(const std::string& text, const std::string& place);
// The wsu:Created and wsu:Expires of a Timestamp or Lifetime.
std::pair<Time, Time> ReadPeriod(xmlNode* element);

}  // namespace DevSts

#endif
