#ifndef TARNIK_XML_XML_WRITER_H
#define TARNIK_XML_XML_WRITER_H

#include <tarnik/core/writer.h>
#include <tarnik/xml/node.h>

namespace Tarnik::Xml {

/// Writes `node` and all below it as XML text, without an XML declaration. What a parser reads back
/// is the same tree: text and attributes are escaped as canonical XML does (Canonical XML 1.0,
/// section 2.3). Only what stands in the tree is written: namespace declarations of elements
/// outside `node` are not added.
TARNIK_EXPORT void WriteXml(const Node* node, Writer* writer);

}  // namespace Tarnik::Xml

#endif
