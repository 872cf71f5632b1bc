#include "support/xml_documents.h"

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/writer.h>
#include <tarnik/xml/security/canonicalizer.h>
#include <tarnik/xml/xml_parser.h>

namespace SsoClient {

using Tarnik::Ref;
using Tarnik::Xml::Document;
using Tarnik::Xml::ElementNode;
using Tarnik::Xml::TextNode;

namespace {

/// Reads a text of the caller, which must outlive it.
class TextReader final : public Tarnik::Reader, public Tarnik::ObjectImpl {
 public:
  explicit TextReader(std::string_view text) : rest_(text) {}

  std::size_t Read(char* buffer, std::size_t size) override {
    const std::size_t count = rest_.copy(buffer, size);
    rest_.remove_prefix(count);
    return count;
  }

 private:
  ~TextReader() override = default;

  std::string_view rest_;
};

}  // namespace

Ref<Document> ParseDocument(Tarnik::Reader* reader) {
  const auto handler = Tarnik::Xml::CreateXMLDocumentHandler();
  const auto parser = Tarnik::Xml::CreateXMLParser(reader, handler.get());
  const auto document = parser->Parse();
  return Ref<Document>(Tarnik::CheckedCast<Document>(document.get()));
}

Ref<Document> ParseDocument(const std::string& text) {
  return ParseDocument(Tarnik::MakeRef<TextReader>(text).get());
}

const TextNode* FirstTextChild(const ElementNode* element) {
  if (element == nullptr) {
    return nullptr;
  }
  const auto* child = element->FirstChild();
  if (child == nullptr || child->Kind() != Tarnik::Xml::NodeKind::kText) {
    return nullptr;
  }
  return Tarnik::CheckedCast<const TextNode>(child);
}

std::string_view ElementText(const ElementNode* element) {
  const auto* text = FirstTextChild(element);
  return text == nullptr ? std::string_view() : text->Text();
}

const ElementNode* FindDescendant(const ElementNode& element,
                                  std::initializer_list<std::string_view> path) {
  const ElementNode* current = &element;
  for (const auto localName : path) {
    current = current->FirstChildElement(localName);
    if (current == nullptr) {
      return nullptr;
    }
  }
  return current;
}

std::string CanonicalizeElement(const ElementNode* element) {
  if (element == nullptr) {
    return {};
  }
  const auto writer = Tarnik::CreateStringWriter();
  Tarnik::Xml::Security::CreateCanonicalizer("http://www.w3.org/TR/2001/REC-xml-c14n-20010315#")
      ->Canonicalize(element, writer.get());
  return writer->TakeText();
}

}  // namespace SsoClient
