#ifndef SSOCLIENT_XML_ATTRIBUTE_MAP_H
#define SSOCLIENT_XML_ATTRIBUTE_MAP_H

#include <map>
#include <string>
#include <utility>
#include <vector>

namespace SsoClient {

/// Attributes as callers list them: qualified names and values. Namespace declarations are
/// attributes named "xmlns:p" among them.
using AttributeList = std::vector<std::pair<std::string, std::string>>;

/// Attributes as they are set on an element: in ascending byte order of their names.
using AttributeMap = std::map<std::string, std::string>;

/// Keeps the first value of a name that is given twice.
AttributeMap ToAttributeMap(const AttributeList& attributes);

}  // namespace SsoClient

#endif
