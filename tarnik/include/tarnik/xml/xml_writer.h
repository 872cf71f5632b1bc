#ifndef TARNIK_XML_XML_WRITER_H
#define TARNIK_XML_XML_WRITER_H

#include <tarnik/core/writer.h>
#include <tarnik/xml/node.h>

namespace Tarnik::Xml {

/// Writes `node` with all its content as XML text, without an XML declaration. Parsing the text
/// gives the same tree: text and attributes are escaped as in Canonical XML 1.0, section 2.3.
/// Namespace declarations of elements outside of `node` are not added. A tree that was built may
/// exceed the parser's limits on depth, attributes and size (see `XMLParser`); it is written too.
TARNIK_EXPORT void WriteXml(const Node* node, Writer* writer);

}  // namespace Tarnik::Xml

#endif
