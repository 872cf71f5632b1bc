#include "support/parsed_xml.h"

#include <stdexcept>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/reader.h>
#include <tarnik/xml/xml_parser.h>

#include "support/assertion_text.h"
#include "token/child_cursor.h"
#include "token/strict_rules.h"

namespace TestSupport {

using Tarnik::Ref;
using Tarnik::Xml::ElementNode;

Ref<Tarnik::Xml::Document> ParseXml(const std::string& xml) {
  const Ref<Tarnik::Reader> reader = Tarnik::CreateStringReader(xml);
  const Ref<Tarnik::Xml::XMLHandler> handler = Tarnik::Xml::CreateXMLDocumentHandler();
  const Ref<Tarnik::Object> document =
      Tarnik::Xml::CreateXMLParser(reader.get(), handler.get())->Parse();
  return Ref<Tarnik::Xml::Document>(Tarnik::CheckedCast<Tarnik::Xml::Document>(document.get()));
}

ElementNode* FindElement(ElementNode* root, std::string_view localName) {
  ElementNode* element = root;
  while (element != nullptr && element->LocalName() != localName) {
    element = element->NextElement(root);
  }
  return element;
}

Fragment::Fragment(const std::string& content)
    : document_(ParseXml("<root " + NamespaceDeclarations() + ">" + content + "</root>")),
      cursor_(*document_->RootElement(),
              std::make_shared<const SsoClient::SkipWsAndCommentsFilter>()) {}

ElementNode& Fragment::Element() const {
  for (Tarnik::Xml::Node* child = Root().FirstChild(); child != nullptr;
       child = child->NextSibling()) {
    if (ElementNode* element = SsoClient::AsElement(child)) {
      return *element;
    }
  }
  throw std::logic_error("The fragment holds no element.");
}

}  // namespace TestSupport
