#ifndef FUZZ_XML_INPUT_H
#define FUZZ_XML_INPUT_H

#include <string>

#include <tarnik/core/ref.h>
#include <tarnik/xml/document.h>

namespace Fuzz {

/// The document of this text, or null when it is refused.
Tarnik::Ref<Tarnik::Xml::Document> ParseXml(const std::string& text);

/// True when a namespace declared in the document is a relative URI, which canonical XML does not
/// allow.
bool HasRelativeNamespace(const Tarnik::Xml::Document& document);

/// True when libxml2 has something of its own to say about a namespace declared in the document. It
/// refuses URIs that it takes for malformed, which XML leaves free, and does not escape them in
/// canonical text, as Canonical XML 1.0, section 2.3, demands; there it is no oracle.
bool HasOddNamespace(const Tarnik::Xml::Document& document);

}  // namespace Fuzz

#endif
