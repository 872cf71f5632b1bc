#include "token/name_id_reader.h"

#include <string>

#include "token/attribute_rules.h"
#include "token/element_rules.h"
#include "token/principal_parser.h"
#include "token/saml_names.h"

namespace SsoClient {

NameId ReadNameId(ChildCursor& cursor, std::string_view localName) {
  const Tarnik::Xml::ElementNode& element =
      ExpectElement(cursor.Current(), localName, kSamlNamespace);
  CheckAttributes(element, {}, {"Format"});
  NameId nameId{std::string(element.FindAttribute("Format").value_or("")),
                std::string(ReadTextContent(element))};
  cursor.Advance();
  return nameId;
}

PrincipalId ReadPrincipal(ChildCursor& cursor) {
  const NameId nameId = ReadNameId(cursor, "NameID");
  return PrincipalFromNameId(nameId.format, nameId.value);
}

}  // namespace SsoClient
