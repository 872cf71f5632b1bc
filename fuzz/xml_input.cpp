#include "xml_input.h"

#include <memory>
#include <string_view>

#include <libxml/uri.h>

#include <tarnik/xml/xml_parse_exception.h>

#include "support/parse_xml.h"

namespace Fuzz {
namespace {

using namespace Tarnik;

struct FreeUri {
  void operator()(xmlURI* uri) const { xmlFreeURI(uri); }
};

bool IsOdd(std::string_view uri) {
  const std::unique_ptr<xmlURI, FreeUri> parsed(xmlParseURI(std::string(uri).c_str()));
  return parsed == nullptr || uri.find_first_of("&<\"\t\r\n") != std::string_view::npos;
}

bool IsRelative(std::string_view uri) {
  const std::unique_ptr<xmlURI, FreeUri> parsed(xmlParseURI(std::string(uri).c_str()));
  return parsed != nullptr && !uri.empty() && parsed->scheme == nullptr;
}

using Predicate = bool (*)(std::string_view);

bool Declares(const Xml::ElementNode& element, Predicate predicate) {
  for (std::size_t i = 0; i < element.AttributeCount(); ++i) {
    const Xml::Attribute& attribute = element.AttributeAt(i);
    if (attribute.IsNamespaceDeclaration() && predicate(attribute.Value())) {
      return true;
    }
  }
  for (const Xml::Node* node = element.FirstChild(); node != nullptr; node = node->NextSibling()) {
    if (node->Kind() == Xml::NodeKind::kElement &&
        Declares(static_cast<const Xml::ElementNode&>(*node), predicate)) {
      return true;
    }
  }
  return false;
}

}  // namespace

Ref<Xml::Document> ParseXml(const std::string& text) {
  try {
    return SsoClient::Testing::ParseXml(text);
  } catch (const Xml::XMLParseException&) {
    return nullptr;
  }
}

bool HasRelativeNamespace(const Xml::Document& document) {
  return Declares(*document.RootElement(), IsRelative);
}

bool HasOddNamespace(const Xml::Document& document) {
  return Declares(*document.RootElement(), IsOdd);
}

}  // namespace Fuzz
