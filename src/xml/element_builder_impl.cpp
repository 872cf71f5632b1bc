#include "xml/element_builder_impl.h"

namespace SsoClient {

ElementBuilderImpl::ElementBuilderImpl(std::string_view prefix, std::string_view localName,
                                       const AttributeList& attributes)
    : prefix_(prefix), localName_(localName), attributes_(ToAttributeMap(attributes)) {}

void ElementBuilderImpl::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  CreateElementWithAttributes(prefix_, localName_, attributes_, out);
}

void CreateElementWithAttributes(const std::string& prefix, const std::string& localName,
                                 const AttributeMap& attributes,
                                 Tarnik::Ref<Tarnik::Xml::ElementNode>& out) {
  Tarnik::Xml::CreateElementNode(prefix, localName, out);
  for (const auto& [name, value] : attributes) {
    out->SetAttribute(name, value);
  }
}

}  // namespace SsoClient
