#ifndef SSOCLIENT_TESTS_SUPPORT_FRAGMENT_H
#define SSOCLIENT_TESTS_SUPPORT_FRAGMENT_H

#include <string>

#include <tarnik/core/ref.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>

#include "token/child_cursor.h"

namespace SsoClient::Testing {

/// The content of an element in which the prefixes saml2, ds, rsa, del, xs and xsi are bound, with
/// a cursor over it.
class Fragment {
 public:
  explicit Fragment(const std::string& content);

  Tarnik::Xml::ElementNode& Root() const { return *document_->RootElement(); }
  /// The first child element.
  Tarnik::Xml::ElementNode& Element() const;
  ChildCursor& Cursor() { return cursor_; }

 private:
  Tarnik::Ref<Tarnik::Xml::Document> document_;
  ChildCursor cursor_;
};

}  // namespace SsoClient::Testing

#endif
