#ifndef TARNIK_XML_NAMESPACES_H
#define TARNIK_XML_NAMESPACES_H

#include <string_view>

namespace Tarnik::Xml {

/// The namespaces that Namespaces in XML 1.0, section 3, binds to "xml" and "xmlns".
inline constexpr std::string_view kXmlNamespace = "http://www.w3.org/XML/1998/namespace";
inline constexpr std::string_view kXmlnsNamespace = "http://www.w3.org/2000/xmlns/";

}  // namespace Tarnik::Xml

#endif
