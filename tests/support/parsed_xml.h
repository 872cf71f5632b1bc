#ifndef SSOCLIENT_TESTS_PARSED_XML_H
#define SSOCLIENT_TESTS_PARSED_XML_H

#include <memory>
#include <string>

#include <tarnik/core/ref.h>
#include <tarnik/xml/document.h>

#include "token/child_cursor.h"

namespace TestSupport {

/// Parses a document as the library does.
Tarnik::Ref<Tarnik::Xml::Document> ParseXml(const std::string& xml);

/// The first element with this local name in document order, the root included; null if there is
/// none.
Tarnik::Xml::ElementNode* FindElement(Tarnik::Xml::ElementNode* root, std::string_view localName);

/// The content of an element in whose scope the prefixes saml2, ds, rsa, del, xs and xsi are bound,
/// with a cursor over it.
class Fragment {
 public:
  explicit Fragment(const std::string& content);

  Tarnik::Xml::ElementNode& Root() const { return *document_->RootElement(); }
  /// The first child element.
  Tarnik::Xml::ElementNode& Element() const;
  SsoClient::ChildCursor& Cursor() { return cursor_; }

 private:
  Tarnik::Ref<Tarnik::Xml::Document> document_;
  SsoClient::ChildCursor cursor_;
};

}  // namespace TestSupport

#endif
