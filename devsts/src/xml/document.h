#ifndef DEVSTS_XML_DOCUMENT_H
#define DEVSTS_XML_DOCUMENT_H

#include <libxml/parser.h>
#include <libxml/tree.h>
#include <libxml/xpath.h>

#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace DevSts {

struct FreeDocument {
  void operator()(xmlDoc* document) const { xmlFreeDoc(document); }
};
using DocumentHandle = std::unique_ptr<xmlDoc, FreeDocument>;

struct FreeXmlString {
  void operator()(xmlChar* text) const { xmlFree(text); }
};
using XmlString = std::unique_ptr<xmlChar, FreeXmlString>;

// Makes libxml2 and xmlsec1 ready; the first call does, on any thread.
void InitializeXmlLibraries();

// What xmlsec1 complained about on this thread since the last call, the root of the trouble first.
std::string TakeXmlSecErrors();

// Parses a document without a document type and without any I/O. Throws XmlError with line and
// reason.
DocumentHandle ParseXml(std::string_view text);

// The document as libxml2 writes it, without a declaration.
std::string WriteXml(xmlDoc* document);

const xmlChar* AsXml(const char* text);
std::string_view AsText(const xmlChar* text);
std::string_view LocalName(const xmlNode* node);
std::string_view NamespaceUri(const xmlNode* node);
bool IsElement(const xmlNode* node, std::string_view namespaceUri, std::string_view localName);

// Text of the element's whole content.
std::string ContentOf(const xmlNode* node);

// Attribute without a namespace, or of the given one; empty if absent.
std::string AttributeOf(const xmlNode* element, const char* name, const char* uri = nullptr);
bool HasAttribute(const xmlNode* element, const char* name, const char* uri = nullptr);

// The child elements in document order.
std::vector<xmlNode*> ChildElements(const xmlNode* element);

// The next element in document order, the descendants first; null at the end of `root`.
xmlNode* NextElement(const xmlNode* root, xmlNode* node);

// The elements below (and including) `root` of this name.
std::vector<xmlNode*> FindElements(xmlNode* root, std::string_view namespaceUri,
                                   std::string_view localName);

// The value of an attribute that names an element: ID, Id, AssertionID or wsu:Id; empty if none.
std::string IdOf(const xmlNode* element);

// Makes every such attribute known to the document, so that references find it.
void RegisterIds(xmlDoc* document);

}  // namespace DevSts

#endif
