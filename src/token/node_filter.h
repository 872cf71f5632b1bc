#ifndef SSOCLIENT_TOKEN_NODE_FILTER_H
#define SSOCLIENT_TOKEN_NODE_FILTER_H

#include <tarnik/xml/node.h>

namespace SsoClient {

/// Decides which nodes a reader gets to see. Implementations are safe to share between threads.
class NodeFilter {
 public:
  /// True when the reader is to see `node`, false when it is to skip it.
  virtual bool IsVisible(const Tarnik::Xml::Node& node) const = 0;

 protected:
  ~NodeFilter() = default;
};

}  // namespace SsoClient

#endif
