#ifndef FUZZ_XML_INPUT_H
#define FUZZ_XML_INPUT_H

#include <string>

#include <tarnik/core/ref.h>
#include <tarnik/xml/document.h>

namespace Fuzz {

/// The parsed document, or null if the text is refused.
Tarnik::Ref<Tarnik::Xml::Document> ParseXml(const std::string& text);

/// True if a namespace declared in the document is a relative URI, which Canonical XML does not
/// allow.
bool HasRelativeNamespace(const Tarnik::Xml::Document& document);

/// True if libxml2 does not handle a namespace declared in the document as the standards require,
/// so that results cannot be compared. It refuses malformed URIs, which XML allows, and does not
/// escape them in canonical text (Canonical XML 1.0, section 2.3).
bool HasOddNamespace(const Tarnik::Xml::Document& document);

}  // namespace Fuzz

#endif
