#ifndef SSOCLIENT_XML_XML_BASE_BUILDER_H
#define SSOCLIENT_XML_XML_BASE_BUILDER_H

#include <tarnik/core/ref.h>
#include <tarnik/xml/element_node.h>

namespace SsoClient {

/// Describes one element with all that is in it. Immutable once assembled, so that one builder may
/// stand in several parents and be built from several threads at once.
class XMLBaseBuilder {
 public:
  XMLBaseBuilder() = default;
  XMLBaseBuilder(const XMLBaseBuilder&) = delete;
  XMLBaseBuilder& operator=(const XMLBaseBuilder&) = delete;

  /// Replaces what `out` held with the element. After an exception `out` may hold a part of it.
  virtual void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const = 0;
  virtual ~XMLBaseBuilder() = default;
};

}  // namespace SsoClient

#endif
