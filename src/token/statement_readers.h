#ifndef SSOCLIENT_TOKEN_STATEMENT_READERS_H
#define SSOCLIENT_TOKEN_STATEMENT_READERS_H

#include <string_view>
#include <vector>

#include "token/child_cursor.h"
#include "token/parsed_assertion.h"

namespace SsoClient {

/// One SAML Attribute (SAML 2.0 core, section 2.7.3.1). The texts live in the tree.
struct AttributeView {
  std::string_view name;
  std::string_view nameFormat;    ///< empty when absent
  std::string_view friendlyName;  ///< empty when absent
  std::vector<std::string_view> values;
};

/// What becomes of an AttributeValue without any content.
enum class EmptyValues {
  kRefused,
  kRead,  ///< as the empty text
};

/// Reads an Attribute and its AttributeValue children, each of which holds text alone. Throws
/// `ParseException`.
AttributeView ReadSamlAttribute(ChildCursor& cursor,
                                EmptyValues emptyValues = EmptyValues::kRefused);

/// Reads an AuthnStatement (SAML 2.0 core, section 2.7.2). Throws `ParseException`.
AuthnStatement ReadAuthnStatement(ChildCursor& cursor);

/// Reads an AttributeStatement (SAML 2.0 core, section 2.7.3). Attributes of names that mean
/// nothing here are checked for their form and left. Throws `ParseException`.
SubjectAttributes ReadAttributeStatement(ChildCursor& cursor);

}  // namespace SsoClient

#endif
