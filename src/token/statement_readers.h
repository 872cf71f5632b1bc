#ifndef SSOCLIENT_TOKEN_STATEMENT_READERS_H
#define SSOCLIENT_TOKEN_STATEMENT_READERS_H

#include <string_view>
#include <vector>

#include "token/child_cursor.h"
#include "token/parsed_assertion.h"

// The statements of an assertion, and the SAML attributes that statements and advice consist of.
namespace SsoClient {

/// Reads an AuthnStatement (SAML 2.0 core, section 2.7.2). Throws `ParseException`.
AuthnStatement ReadAuthnStatement(ChildCursor& cursor);

/// Reads an AttributeStatement (SAML 2.0 core, section 2.7.3). Attributes of unknown names are only
/// checked for their form. Throws `ParseException`.
SubjectAttributes ReadAttributeStatement(ChildCursor& cursor);

/// One SAML Attribute (SAML 2.0 core, section 2.7.3.1). The views point into the tree.
struct AttributeView {
  std::string_view name;
  std::string_view nameFormat;    ///< empty when absent
  std::string_view friendlyName;  ///< empty when absent
  std::vector<std::string_view> values;
};

/// Reads an Attribute and its AttributeValue children, each of which has only text or no content,
/// which is an empty text. The types of the values are not read. Throws `ParseException`.
AttributeView ReadSamlAttribute(ChildCursor& cursor);

}  // namespace SsoClient

#endif
