#include "support/libxml2_oracle.h"

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <libxml/c14n.h>
#include <libxml/parser.h>
#include <libxml/xmlerror.h>

namespace Tarnik::Testing {

namespace {

struct DocumentDeleter {
  void operator()(xmlDoc* document) const noexcept { xmlFreeDoc(document); }
};
struct ContextDeleter {
  void operator()(xmlParserCtxt* context) const noexcept { xmlFreeParserCtxt(context); }
};
struct BufferDeleter {
  void operator()(xmlOutputBuffer* buffer) const noexcept { xmlOutputBufferClose(buffer); }
};
using DocumentHolder = std::unique_ptr<xmlDoc, DocumentDeleter>;

DocumentHolder Parse(const std::string& xml, bool& wellFormed) {
  const std::unique_ptr<xmlParserCtxt, ContextDeleter> context(xmlNewParserCtxt());
  constexpr int kOptions = XML_PARSE_NONET | XML_PARSE_NOERROR | XML_PARSE_NOWARNING |
                           XML_PARSE_NOCDATA | XML_PARSE_HUGE | XML_PARSE_NOENT;
  DocumentHolder document(xmlCtxtReadMemory(context.get(), xml.data(), static_cast<int>(xml.size()),
                                            nullptr, nullptr, kOptions));
  wellFormed = document != nullptr && context->wellFormed != 0 && context->nsWellFormed != 0;
  return document;
}

xmlNode* NextInDocument(xmlNode* node) {
  if (node->type == XML_ELEMENT_NODE && node->children != nullptr) {
    return node->children;
  }
  while (node != nullptr && node->next == nullptr) {
    node =
        node->parent != nullptr && node->parent->type == XML_ELEMENT_NODE ? node->parent : nullptr;
  }
  return node == nullptr ? nullptr : node->next;
}

xmlNode* ElementAt(xmlDoc* document, int index) {
  xmlNode* node = xmlDocGetRootElement(document);
  while (node != nullptr) {
    if (node->type == XML_ELEMENT_NODE && index-- == 0) {
      return node;
    }
    node = NextInDocument(node);
  }
  return nullptr;
}

int IsInSubtree(void* apex, xmlNode* node, xmlNode* parent) {
  // A namespace node has no link to its element, which is passed as the parent.
  xmlNode* up = node->type == XML_NAMESPACE_DECL ? parent : node;
  while (up != nullptr && up != apex) {
    up = up->parent;
  }
  return up == nullptr ? 0 : 1;
}

void IgnoreError(void*, xmlError*) {}

}  // namespace

std::optional<std::string> CanonicalizeWithLibXml2(const std::string& xml,
                                                   const OracleRequest& request) {
  bool wellFormed = false;
  const DocumentHolder document = Parse(xml, wellFormed);
  if (!wellFormed) {
    return std::nullopt;
  }
  xmlSetStructuredErrorFunc(nullptr, IgnoreError);
  std::vector<std::vector<xmlChar>> texts;
  std::vector<xmlChar*> prefixes;
  texts.reserve(request.inclusivePrefixes.size());
  for (const std::string& prefix : request.inclusivePrefixes) {
    texts.emplace_back(prefix.begin(), prefix.end());
    texts.back().push_back(0);
    prefixes.push_back(texts.back().data());
  }
  prefixes.push_back(nullptr);
  xmlNode* apex = request.element ? ElementAt(document.get(), *request.element) : nullptr;
  std::unique_ptr<xmlOutputBuffer, BufferDeleter> buffer(xmlAllocOutputBuffer(nullptr));
  const int written = xmlC14NExecute(document.get(), apex == nullptr ? nullptr : IsInSubtree, apex,
                                     request.exclusive ? XML_C14N_EXCLUSIVE_1_0 : XML_C14N_1_0,
                                     prefixes.size() > 1 ? prefixes.data() : nullptr,
                                     request.withComments ? 1 : 0, buffer.get());
  xmlSetStructuredErrorFunc(nullptr, nullptr);
  if (written < 0) {
    return std::nullopt;
  }
  const xmlChar* content = xmlOutputBufferGetContent(buffer.get());
  return std::string(content, content + xmlOutputBufferGetSize(buffer.get()));
}

bool IsWellFormedForLibXml2(const std::string& xml) {
  bool wellFormed = false;
  Parse(xml, wellFormed);
  return wellFormed;
}

}  // namespace Tarnik::Testing
