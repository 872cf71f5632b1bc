#ifndef SSOCLIENT_TOKEN_ATTRIBUTE_READER_H
#define SSOCLIENT_TOKEN_ATTRIBUTE_READER_H

#include <string_view>
#include <vector>

#include "token/child_cursor.h"

namespace SsoClient {

/// One SAML Attribute (SAML 2.0 core, section 2.7.3.1). The texts live in the tree.
struct AttributeView {
  std::string_view name;
  std::string_view nameFormat;    ///< empty when absent
  std::string_view friendlyName;  ///< empty when absent
  std::vector<std::string_view> values;
};

/// Reads an Attribute and its AttributeValue children. Throws `ParseException`.
AttributeView ReadSamlAttribute(ChildCursor& cursor);

}  // namespace SsoClient

#endif
