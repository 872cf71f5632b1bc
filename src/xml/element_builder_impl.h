#ifndef SSOCLIENT_XML_ELEMENT_BUILDER_IMPL_H
#define SSOCLIENT_XML_ELEMENT_BUILDER_IMPL_H

#include <string>
#include <string_view>

#include "xml/attribute_map.h"
#include "xml/xml_base_builder.h"

namespace SsoClient {

/// An element with attributes and nothing in it.
class ElementBuilderImpl final : public XMLBaseBuilder {
 public:
  ElementBuilderImpl(std::string_view prefix, std::string_view localName,
                     const AttributeList& attributes);

  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  std::string prefix_;
  std::string localName_;
  AttributeMap attributes_;
};

/// Makes the element that both kinds of element builder start from. What the platform throws passes
/// unchanged: `Tarnik::InvalidArgumentException`, naming element and attribute but never the value,
/// when XML cannot carry a value.
void CreateElementWithAttributes(const std::string& prefix, const std::string& localName,
                                 const AttributeMap& attributes,
                                 Tarnik::Ref<Tarnik::Xml::ElementNode>& out);

}  // namespace SsoClient

#endif
