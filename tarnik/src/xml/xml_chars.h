#ifndef TARNIK_XML_XML_CHARS_H
#define TARNIK_XML_XML_CHARS_H

#include <string_view>

namespace Tarnik::Xml {

/// True when `text` is UTF-8 and all its characters are allowed in XML 1.0 (section 2.2).
bool IsXmlText(std::string_view text) noexcept;

/// True for a name without a colon (Namespaces in XML 1.0, section 3), which the parser can read:
/// its characters are those of XML 1.0, fourth edition.
bool IsNCName(std::string_view name) noexcept;

/// True for "local" and "prefix:local" with NCNames (Namespaces in XML 1.0, section 4).
bool IsQualifiedName(std::string_view name) noexcept;

}  // namespace Tarnik::Xml

#endif
