#include <tarnik/xml/document.h>

namespace Tarnik::Xml {

ElementNode* Document::RootElement() const noexcept {
  for (Node* node = FirstChild(); node != nullptr; node = node->NextSibling()) {
    if (node->Kind() == NodeKind::kElement) {
      return static_cast<ElementNode*>(node);
    }
  }
  return nullptr;
}

}  // namespace Tarnik::Xml
