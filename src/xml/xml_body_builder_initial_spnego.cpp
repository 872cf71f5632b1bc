#include "xml/xml_body_builder_initial_spnego.h"

#include <utility>

#include <tarnik/text/string_util.h>

#include "xml/binary_exchange.h"
#include "xml/issue_body.h"

namespace SsoClient {

XMLBodyBuilderInitialSPNego::XMLBodyBuilderInitialSPNego(unsigned keyType, TokenSpec spec,
                                                         std::vector<unsigned char> leg)
    : keyType_(keyType), spec_(std::move(spec)), leg_(std::move(leg)) {}

XMLBodyBuilderInitialSPNego::~XMLBodyBuilderInitialSPNego() {
  Tarnik::StringUtil::Cleanse(leg_);
}

void XMLBodyBuilderInitialSPNego::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  const auto body = BuildIssueBodyWithUseKey(keyType_, spec_);
  body->Add(BuildBinaryExchange(leg_));
  body->Build(out);
  out->SetAttribute("Context", "urn:uuid:" + Tarnik::StringUtil::GenerateUuid());
}

}  // namespace SsoClient
