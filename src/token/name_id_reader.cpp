#include "token/name_id_reader.h"

#include <string>

#include <ssoclient/exceptions.h>

#include "support/concat.h"
#include "support/namespaces.h"
#include "token/strict_rules.h"

namespace SsoClient {

namespace {

constexpr std::string_view kUpnFormat = "http://schemas.xmlsoap.org/claims/UPN";

bool SeparatesTwoParts(std::size_t separator, std::string_view value) {
  return separator != std::string_view::npos && separator != 0 && separator + 1 != value.size();
}

}  // namespace

PrincipalId PrincipalFromNameId(std::string_view format, std::string_view value) {
  if (format != kUpnFormat) {
    throw ParseException(Concat({"Invalid or unsupported NameId format '", format}));
  }
  const std::size_t at = value.rfind('@');
  if (!SeparatesTwoParts(at, value)) {
    throw ParseException(
        Concat({"Failed to parse the UPN NameID: `", value, "'; name or domain part is missing."}));
  }
  return {std::string(value.substr(0, at)), std::string(value.substr(at + 1))};
}

PrincipalId PrincipalFromGroupIdentity(std::string_view value) {
  const std::size_t backslash = value.find('\\');
  if (!SeparatesTwoParts(backslash, value)) {
    throw ParseException(
        Concat({"Failed to parse Group Identity value: `", value, "'; domain or group missing"}));
  }
  return {std::string(value.substr(backslash + 1)), std::string(value.substr(0, backslash))};
}

NameId ReadNameId(ChildCursor& cursor, std::string_view localName) {
  const Tarnik::Xml::ElementNode& element = cursor.TakeElement(localName, kSamlNamespace);
  CheckAttributes(element, {}, {"Format"});
  NameId nameId{std::string(element.FindAttribute("Format").value_or("")),
                std::string(ReadTextContent(element))};
  return nameId;
}

PrincipalId ReadPrincipal(ChildCursor& cursor) {
  const NameId nameId = ReadNameId(cursor, "NameID");
  return PrincipalFromNameId(nameId.format, nameId.value);
}

}  // namespace SsoClient
