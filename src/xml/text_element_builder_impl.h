#ifndef SSOCLIENT_XML_TEXT_ELEMENT_BUILDER_IMPL_H
#define SSOCLIENT_XML_TEXT_ELEMENT_BUILDER_IMPL_H

#include <string>
#include <string_view>

#include "xml/attribute_map.h"
#include "xml/xml_base_builder.h"

namespace SsoClient {

/// An element whose only child is a text node, also when the text is empty. The text is cleansed
/// from memory when the builder dies, since it may be a password.
class TextElementBuilderImpl final : public XMLBaseBuilder {
 public:
  TextElementBuilderImpl(std::string_view prefix, std::string_view localName, std::string_view text,
                         const AttributeList& attributes);
  ~TextElementBuilderImpl() override;

  /// Passes on the platform's `Tarnik::InvalidArgumentException`, which names the element but never
  /// the text, when XML cannot carry the text.
  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  std::string prefix_;
  std::string localName_;
  AttributeMap attributes_;
  std::string text_;
};

}  // namespace SsoClient

#endif
