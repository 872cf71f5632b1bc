#include "xml/pre_built_element_impl.h"

#include <utility>

namespace SsoClient {

PreBuiltElementImpl::PreBuiltElementImpl(Tarnik::Ref<Tarnik::Xml::ElementNode> element)
    : element_(std::move(element)) {}

void PreBuiltElementImpl::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  out = element_;
}

}  // namespace SsoClient
