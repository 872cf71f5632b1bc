#ifndef SSOCLIENT_XML_XML_BODY_BUILDER_CONTINUED_SPNEGO_H
#define SSOCLIENT_XML_XML_BODY_BUILDER_CONTINUED_SPNEGO_H

#include <string>
#include <vector>

#include "xml/xml_base_builder.h"

namespace SsoClient {

/// A later leg of an SPNego negotiation (WS-Trust 1.3, section 8). The prefix wst is declared by an
/// element around it. The leg, which logs its maker in, is cleansed from memory when the builder
/// dies.
class XMLBodyBuilderContinuedSPNego final : public XMLBaseBuilder {
 public:
  /// `contextId` is the one that the service gave the negotiation.
  XMLBodyBuilderContinuedSPNego(std::string contextId, std::vector<unsigned char> leg);
  ~XMLBodyBuilderContinuedSPNego() override;

  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  std::string contextId_;
  std::vector<unsigned char> leg_;
};

}  // namespace SsoClient

#endif
