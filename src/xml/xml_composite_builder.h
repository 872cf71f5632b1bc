#ifndef SSOCLIENT_XML_XML_COMPOSITE_BUILDER_H
#define SSOCLIENT_XML_XML_COMPOSITE_BUILDER_H

#include <memory>
#include <vector>

#include "xml/xml_base_builder.h"

namespace SsoClient {

/// A root element with further children behind the root's own.
class XMLCompositeBuilder final : public XMLBaseBuilder {
 public:
  explicit XMLCompositeBuilder(std::shared_ptr<XMLBaseBuilder> root);

  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

  /// Appends a child; an empty pointer, an optional element that is left out, adds nothing. Only
  /// for the function that assembles this builder. Returns this builder.
  XMLCompositeBuilder& Add(std::shared_ptr<XMLBaseBuilder> child);

 private:
  std::shared_ptr<XMLBaseBuilder> root_;
  std::vector<std::shared_ptr<XMLBaseBuilder>> children_;
};

}  // namespace SsoClient

#endif
