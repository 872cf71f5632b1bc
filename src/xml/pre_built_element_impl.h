#ifndef SSOCLIENT_XML_PRE_BUILT_ELEMENT_IMPL_H
#define SSOCLIENT_XML_PRE_BUILT_ELEMENT_IMPL_H

#include <tarnik/core/ref.h>
#include <tarnik/xml/element_node.h>

#include "xml/xml_base_builder.h"

namespace SsoClient {

/// An element that exists already. Each build hands out that very element, so it must not be built
/// into two trees at once: the later one takes it from the earlier.
class PreBuiltElementImpl final : public XMLBaseBuilder {
 public:
  explicit PreBuiltElementImpl(Tarnik::Ref<Tarnik::Xml::ElementNode> element);

  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  Tarnik::Ref<Tarnik::Xml::ElementNode> element_;
};

}  // namespace SsoClient

#endif
