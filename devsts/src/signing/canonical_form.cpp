#include "signing/canonical_form.h"

#include <memory>

#include <libxml/c14n.h>
#include <libxml/xpath.h>

#include "signing/algorithms.h"
#include "signing/openssl_handles.h"
#include "xml/document.h"

namespace DevSts {
namespace {

using XPathContextHandle = std::unique_ptr<xmlXPathContext, FreeWith<xmlXPathFreeContext>>;
using XPathObjectHandle = std::unique_ptr<xmlXPathObject, FreeWith<xmlXPathFreeObject>>;

bool KeepsComments(CanonicalMode mode) {
  return mode == CanonicalMode::InclusiveWithComments ||
         mode == CanonicalMode::ExclusiveWithComments;
}

// Attributes and namespace declarations are visible if their element is, which libxml2 passes as
// `parent`.
int IsWithin(void* apex, xmlNode* node, xmlNode* parent) {
  if (apex == nullptr) {
    return 1;
  }
  const bool belongsToParent =
      node == nullptr || node->type == XML_NAMESPACE_DECL || node->type == XML_ATTRIBUTE_NODE;
  for (const xmlNode* at = belongsToParent ? parent : node; at != nullptr; at = at->parent) {
    if (at == apex) {
      return 1;
    }
  }
  return 0;
}

xmlNode* ElementOfId(xmlDoc* document, const std::string& id) {
  xmlNode* found = nullptr;
  xmlNode* root = xmlDocGetRootElement(document);
  for (xmlNode* node = root; node != nullptr; node = NextElement(root, node)) {
    if (IdOf(node) != id) {
      continue;
    }
    if (found != nullptr) {
      throw XmlError("two elements have the id " + id);
    }
    found = node;
  }
  if (found == nullptr) {
    throw XmlError("no element has the id " + id);
  }
  return found;
}

void IgnoreXPathError(void* /*context*/, xmlError* /*error*/) {}

xmlNode* ElementOfXPath(xmlDoc* document, const std::string& expression) {
  const XPathContextHandle context(xmlXPathNewContext(document));
  if (!context) {
    throw XmlError("no memory for an XPath context");
  }
  context->error = IgnoreXPathError;
  const XPathObjectHandle result(xmlXPathEvalExpression(AsXml(expression.c_str()), context.get()));
  if (!result || result->type != XPATH_NODESET ||
      xmlXPathNodeSetGetLength(result->nodesetval) != 1 ||
      result->nodesetval->nodeTab[0]->type != XML_ELEMENT_NODE) {
    throw XmlError("the expression does not select exactly one element: " + expression);
  }
  return result->nodesetval->nodeTab[0];
}

xmlNode* Select(xmlDoc* document, std::string_view selector) {
  if (selector.empty()) {
    return nullptr;
  }
  if (selector.front() == '#') {
    return ElementOfId(document, std::string(selector.substr(1)));
  }
  return ElementOfXPath(document, std::string(selector));
}

}  // namespace

std::string CanonicalForm(xmlDoc* document, xmlNode* element, CanonicalMode mode,
                          const std::vector<std::string>& inclusivePrefixes) {
  std::vector<std::string> names = inclusivePrefixes;
  std::vector<xmlChar*> prefixes;
  prefixes.reserve(names.size() + 1);
  for (std::string& name : names) {
    prefixes.push_back(reinterpret_cast<xmlChar*>(name.data()));
  }
  prefixes.push_back(nullptr);
  xmlOutputBuffer* output = xmlAllocOutputBuffer(nullptr);
  if (output == nullptr) {
    throw XmlError("no memory for the canonical form");
  }
  const int kind = IsExclusive(mode) ? XML_C14N_EXCLUSIVE_1_0 : XML_C14N_1_0;
  const int written = xmlC14NExecute(document, IsWithin, element, kind, prefixes.data(),
                                     KeepsComments(mode) ? 1 : 0, output);
  std::string text(reinterpret_cast<const char*>(xmlOutputBufferGetContent(output)),
                   xmlOutputBufferGetSize(output));
  xmlOutputBufferClose(output);
  if (written < 0) {
    throw XmlError("libxml2 refuses to canonicalise the text");
  }
  return text;
}

std::string Canonicalize(std::string_view xml, std::string_view selector, CanonicalMode mode,
                         const std::vector<std::string>& inclusivePrefixes) {
  const DocumentHandle document = ParseXml(xml);
  return CanonicalForm(document.get(), Select(document.get(), selector), mode, inclusivePrefixes);
}

}  // namespace DevSts
