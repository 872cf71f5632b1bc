#include "xml/document.h"

#include <mutex>
#include <utility>

#include <xmlsec/xmlsec.h>
#include <libxml/valid.h>
#include <libxml/xmlerror.h>
#include <xmlsec/errors.h>
#include <xmlsec/openssl/app.h>
#include <xmlsec/openssl/crypto.h>

#include "devsts/xml_security.h"
#include "xml/namespaces.h"

namespace DevSts {
namespace {

thread_local std::string xmlSecErrors;

void CollectXmlSecError(const char* /*file*/, int /*line*/, const char* function,
                        const char* object, const char* subject, int reason, const char* message) {
  if (xmlSecErrors.size() > 2000) {
    return;
  }
  if (!xmlSecErrors.empty()) {
    xmlSecErrors += "; ";
  }
  xmlSecErrors += function != nullptr ? function : "";
  for (const char* part : {object, subject, message}) {
    if (part != nullptr && *part != '\0') {
      xmlSecErrors += std::string(" ") + part;
    }
  }
  xmlSecErrors += " (" + std::to_string(reason) + ")";
}

void IgnoreMessage(void* /*context*/, const char* /*format*/, ...) {}

std::string LastParseError(xmlParserCtxt* context) {
  const xmlError* error = xmlCtxtGetLastError(context);
  if (error == nullptr || error->message == nullptr) {
    return "not well-formed";
  }
  std::string message = error->message;
  while (!message.empty() && message.back() == '\n') {
    message.pop_back();
  }
  return "line " + std::to_string(error->line) + ": " + message;
}

struct FreeParser {
  void operator()(xmlParserCtxt* parser) const { xmlFreeParserCtxt(parser); }
};
using ParserHandle = std::unique_ptr<xmlParserCtxt, FreeParser>;

}  // namespace

void InitializeXmlLibraries() {
  static std::once_flag once;
  std::call_once(once, [] {
    xmlInitParser();
    xmlThrDefSetGenericErrorFunc(nullptr, IgnoreMessage);
    if (xmlSecInit() < 0 || xmlSecOpenSSLAppInit(nullptr) < 0 || xmlSecOpenSSLInit() < 0) {
      throw XmlError("xmlsec1 cannot be initialised");
    }
    xmlSecErrorsSetCallback(CollectXmlSecError);
  });
  // The handler is per thread: a thread that used libxml2 before the first call still has the
  // default one.
  xmlSetGenericErrorFunc(nullptr, IgnoreMessage);
}

std::string TakeXmlSecErrors() {
  return std::exchange(xmlSecErrors, {});
}

DocumentHandle ParseXml(std::string_view text) {
  InitializeXmlLibraries();
  const ParserHandle parser(xmlNewParserCtxt());
  if (!parser) {
    throw XmlError("no memory for a parser");
  }
  // libxml2 would ignore what follows.
  if (text.find('\0') != std::string_view::npos) {
    throw XmlError("there is a character 0");
  }
  constexpr int kOptions = XML_PARSE_NONET | XML_PARSE_NOERROR | XML_PARSE_NOWARNING;
  DocumentHandle document(xmlCtxtReadMemory(
      parser.get(), text.data(), static_cast<int>(text.size()), nullptr, nullptr, kOptions));
  // libxml2 also returns a tree if only the namespaces are not well-formed.
  if (!document || parser->wellFormed == 0 || parser->nsWellFormed == 0) {
    throw XmlError(LastParseError(parser.get()));
  }
  if (xmlGetIntSubset(document.get()) != nullptr) {
    throw XmlError("a document type is not accepted");
  }
  return document;
}

std::string WriteXml(xmlDoc* document) {
  xmlOutputBuffer* output = xmlAllocOutputBuffer(nullptr);
  if (output == nullptr) {
    throw XmlError("no memory for the document's text");
  }
  for (xmlNode* node = document->children; node != nullptr; node = node->next) {
    xmlNodeDumpOutput(output, document, node, 0, 0, "UTF-8");
  }
  std::string text(reinterpret_cast<const char*>(xmlOutputBufferGetContent(output)),
                   xmlOutputBufferGetSize(output));
  xmlOutputBufferClose(output);
  return text;
}

const xmlChar* AsXml(const char* text) {
  return reinterpret_cast<const xmlChar*>(text);
}

std::string_view AsText(const xmlChar* text) {
  return text != nullptr ? std::string_view(reinterpret_cast<const char*>(text))
                         : std::string_view();
}

std::string_view LocalName(const xmlNode* node) {
  return AsText(node->name);
}

std::string_view NamespaceUri(const xmlNode* node) {
  return node->ns != nullptr ? AsText(node->ns->href) : std::string_view();
}

bool IsElement(const xmlNode* node, std::string_view namespaceUri, std::string_view localName) {
  return node->type == XML_ELEMENT_NODE && LocalName(node) == localName &&
         NamespaceUri(node) == namespaceUri;
}

std::string ContentOf(const xmlNode* node) {
  const XmlString content(xmlNodeGetContent(node));
  return std::string(AsText(content.get()));
}

std::string AttributeOf(const xmlNode* element, const char* name, const char* uri) {
  const XmlString value(uri != nullptr ? xmlGetNsProp(element, AsXml(name), AsXml(uri))
                                       : xmlGetNoNsProp(element, AsXml(name)));
  return std::string(AsText(value.get()));
}

bool HasAttribute(const xmlNode* element, const char* name, const char* uri) {
  return xmlHasNsProp(element, AsXml(name), uri != nullptr ? AsXml(uri) : nullptr) != nullptr;
}

std::vector<xmlNode*> ChildElements(const xmlNode* element) {
  std::vector<xmlNode*> children;
  for (xmlNode* child = element->children; child != nullptr; child = child->next) {
    if (child->type == XML_ELEMENT_NODE) {
      children.push_back(child);
    }
  }
  return children;
}

xmlNode* FirstChild(const xmlNode* parent, std::string_view namespaceUri,
                    std::string_view localName) {
  for (xmlNode* child : ChildElements(parent)) {
    if (IsElement(child, namespaceUri, localName)) {
      return child;
    }
  }
  return nullptr;
}

namespace {

xmlNode* NextNode(const xmlNode* root, xmlNode* node) {
  if (node->type == XML_ELEMENT_NODE && node->children != nullptr) {
    return node->children;
  }
  while (node != root && node->next == nullptr) {
    node = node->parent;
  }
  return node == root ? nullptr : node->next;
}

}  // namespace

bool HasProcessingInstruction(const xmlDoc* document) {
  for (xmlNode* top = document->children; top != nullptr; top = top->next) {
    for (xmlNode* node = top; node != nullptr; node = NextNode(top, node)) {
      if (node->type == XML_PI_NODE) {
        return true;
      }
    }
  }
  return false;
}

xmlNode* NextElement(const xmlNode* root, xmlNode* node) {
  do {
    node = NextNode(root, node);
  } while (node != nullptr && node->type != XML_ELEMENT_NODE);
  return node;
}

std::vector<xmlNode*> FindElements(xmlNode* root, std::string_view namespaceUri,
                                   std::string_view localName) {
  std::vector<xmlNode*> found;
  for (xmlNode* node = root; node != nullptr; node = NextElement(root, node)) {
    if (IsElement(node, namespaceUri, localName)) {
      found.push_back(node);
    }
  }
  return found;
}

namespace {

bool IsIdAttribute(const xmlAttr* attribute) {
  const std::string_view name = AsText(attribute->name);
  if (attribute->ns == nullptr) {
    return name == "ID" || name == "Id" || name == "AssertionID";
  }
  return name == "Id" && AsText(attribute->ns->href) == kWsuNamespace;
}

const xmlAttr* IdAttributeOf(const xmlNode* element) {
  for (const xmlAttr* attribute = element->properties; attribute != nullptr;
       attribute = attribute->next) {
    if (IsIdAttribute(attribute)) {
      return attribute;
    }
  }
  return nullptr;
}

std::string ValueOf(const xmlAttr* attribute) {
  const XmlString value(xmlNodeListGetString(attribute->doc, attribute->children, 1));
  return std::string(AsText(value.get()));
}

}  // namespace

std::string IdOf(const xmlNode* element) {
  const xmlAttr* attribute = IdAttributeOf(element);
  return attribute != nullptr ? ValueOf(attribute) : std::string();
}

void RegisterIds(xmlDoc* document) {
  xmlNode* root = xmlDocGetRootElement(document);
  for (xmlNode* node = root; node != nullptr; node = NextElement(root, node)) {
    for (xmlAttr* attribute = node->properties; attribute != nullptr; attribute = attribute->next) {
      if (!IsIdAttribute(attribute)) {
        continue;
      }
      const std::string value = ValueOf(attribute);
      xmlAttr* known = xmlGetID(document, AsXml(value.c_str()));
      if (known != nullptr && known != attribute) {
        throw XmlError("two elements have the id " + value);
      }
      if (known == nullptr) {
        xmlAddID(nullptr, document, AsXml(value.c_str()), attribute);
      }
    }
  }
}

}  // namespace DevSts
