#ifndef SSOCLIENT_TOKEN_SKIP_WS_AND_COMMENTS_FILTER_H
#define SSOCLIENT_TOKEN_SKIP_WS_AND_COMMENTS_FILTER_H

#include "token/node_filter.h"

namespace SsoClient {

/// Hides comments and text of white space alone (XML 1.0, section 2.3: S); shows everything else.
class SkipWsAndCommentsFilter final : public NodeFilter {
 public:
  bool IsVisible(const Tarnik::Xml::Node& node) const override;
};

}  // namespace SsoClient

#endif
