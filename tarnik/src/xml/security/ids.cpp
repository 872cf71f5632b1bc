#include <tarnik/xml/security/ids.h>

#include "support/ascii.h"
#include "xml/security/content_reader.h"
#include "xml/tree_builder.h"

namespace Tarnik::Xml::Security {

std::optional<std::string_view> PossibleId(const Attribute& attribute) noexcept {
  const std::string_view name = TreeBuilder::NameOf(attribute).Local();
  if (!EqualsIgnoringCase(name, "id") && name != "AssertionID") {
    return std::nullopt;
  }
  return Trim(attribute.Value());
}

}  // namespace Tarnik::Xml::Security
