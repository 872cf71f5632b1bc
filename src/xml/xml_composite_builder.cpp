#include "xml/xml_composite_builder.h"

#include <utility>

namespace SsoClient {

XMLCompositeBuilder::XMLCompositeBuilder(std::shared_ptr<XMLBaseBuilder> root)
    : root_(std::move(root)) {}

void XMLCompositeBuilder::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  root_->Build(out);
  for (const auto& child : children_) {
    Tarnik::Ref<Tarnik::Xml::ElementNode> element;
    child->Build(element);
    out->AppendChild(element.get());
  }
}

XMLCompositeBuilder& XMLCompositeBuilder::Add(std::shared_ptr<XMLBaseBuilder> child) {
  if (child != nullptr) {
    children_.push_back(std::move(child));
  }
  return *this;
}

}  // namespace SsoClient
