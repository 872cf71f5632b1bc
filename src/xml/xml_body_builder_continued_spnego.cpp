#include "xml/xml_body_builder_continued_spnego.h"

#include <utility>

#include <tarnik/text/string_util.h>

#include "xml/binary_exchange.h"
#include "xml/builder_factories.h"

namespace SsoClient {

XMLBodyBuilderContinuedSPNego::XMLBodyBuilderContinuedSPNego(std::string contextId,
                                                             std::vector<unsigned char> leg)
    : contextId_(std::move(contextId)), leg_(std::move(leg)) {}

XMLBodyBuilderContinuedSPNego::~XMLBodyBuilderContinuedSPNego() {
  Tarnik::StringUtil::Cleanse(leg_);
}

void XMLBodyBuilderContinuedSPNego::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  const auto body = MakeCompositeBuilder("wst", "RequestSecurityTokenResponse");
  body->Add(BuildBinaryExchange(leg_));
  body->Build(out);
  out->SetAttribute("Context", contextId_);
}

}  // namespace SsoClient
