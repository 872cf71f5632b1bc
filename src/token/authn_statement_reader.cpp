#include "token/authn_statement_reader.h"

#include <ssoclient/exceptions.h>

#include "token/attribute_rules.h"
#include "token/element_rules.h"
#include "token/saml_names.h"

namespace SsoClient {
namespace {

using Tarnik::Xml::ElementNode;

std::string_view ReadContextClass(ChildCursor& cursor) {
  const ElementNode& element =
      ExpectElement(cursor.Current(), "AuthnContextClassRef", kSamlNamespace);
  CheckAttributes(element, {});
  const std::string_view contextClass = ReadTextContent(element);
  cursor.Advance();
  return contextClass;
}

std::string_view ReadContext(ChildCursor& cursor) {
  const ElementNode& element = ExpectElement(cursor.Current(), "AuthnContext", kSamlNamespace);
  CheckAttributes(element, {});
  ChildCursor children = cursor.Into(element);
  const std::string_view contextClass = ReadContextClass(children);
  if (!children.IsAtEnd()) {
    throw ParseException("Unexpected elements after AuthnContextClassRef");
  }
  cursor.Advance();
  return contextClass;
}

}  // namespace

AuthnStatement ReadAuthnStatement(ChildCursor& cursor) {
  const ElementNode& element = ExpectElement(cursor.Current(), "AuthnStatement", kSamlNamespace);
  CheckAttributes(element, {"AuthnInstant"});
  AuthnStatement statement;
  statement.instant = ReadDateAttribute(element, "AuthnInstant");
  ChildCursor children = cursor.Into(element);
  statement.contextClass = ReadContext(children);
  if (!children.IsAtEnd()) {
    throw ParseException("Unexpected elements after AuthnContext");
  }
  cursor.Advance();
  return statement;
}

}  // namespace SsoClient
