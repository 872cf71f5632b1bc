#ifndef SSOCLIENT_XML_XML_BODY_BUILDER_INITIAL_SPNEGO_H
#define SSOCLIENT_XML_XML_BODY_BUILDER_INITIAL_SPNEGO_H

#include <vector>

#include <ssoclient/token_spec.h>

#include "xml/xml_base_builder.h"

namespace SsoClient {

/// The request that opens an SPNego negotiation (WS-Trust 1.3, section 8): asks for a token and
/// carries the first leg. Each build draws a new context id. The leg, which logs
/// its maker in, is cleansed from memory when the builder dies.
class XMLBodyBuilderInitialSPNego final : public XMLBaseBuilder {
 public:
  /// `keyType` as for `BuildIssueBody`.
  XMLBodyBuilderInitialSPNego(unsigned keyType, TokenSpec spec, std::vector<unsigned char> leg);
  ~XMLBodyBuilderInitialSPNego() override;

  /// Throws as `BuildIssueBody` does.
  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  unsigned keyType_;
  TokenSpec spec_;
  std::vector<unsigned char> leg_;
};

}  // namespace SsoClient

#endif
