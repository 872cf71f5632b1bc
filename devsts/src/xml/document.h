#ifndef DEVSTS_XML_DOCUMENT_H
#define DEVSTS_XML_DOCUMENT_H

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include <libxml/parser.h>
#include <libxml/tree.h>
#include <libxml/xpath.h>

namespace DevSts {

struct FreeDocument {
  void operator()(xmlDoc* document) const { xmlFreeDoc(document); }
};
using DocumentHandle = std::unique_ptr<xmlDoc, FreeDocument>;

struct FreeXmlString {
  void operator()(xmlChar* text) const { xmlFree(text); }
};
using XmlString = std::unique_ptr<xmlChar, FreeXmlString>;

// Initialises libxml2 and xmlsec1 on the first call, from any thread.
void InitializeXmlLibraries();

// Takes the errors that xmlsec1 has reported on this thread since the last call, the root cause
// first.
std::string TakeXmlSecErrors();

// Parses a document, which must not have a document type, without any I/O. Throws XmlError with the
// line and the reason.
DocumentHandle ParseXml(std::string_view text);

// The document as libxml2 writes it, without a declaration.
std::string WriteXml(xmlDoc* document);

const xmlChar* AsXml(const char* text);
std::string_view AsText(const xmlChar* text);
std::string_view LocalName(const xmlNode* node);
std::string_view NamespaceUri(const xmlNode* node);
bool IsElement(const xmlNode* node, std::string_view namespaceUri, std::string_view localName);

// The text of the element and its descendants.
std::string ContentOf(const xmlNode* node);

// The value of the attribute without a namespace, or in the given one; empty if absent.
std::string AttributeOf(const xmlNode* element, const char* name, const char* uri = nullptr);
bool HasAttribute(const xmlNode* element, const char* name, const char* uri = nullptr);

// The child elements in document order.
std::vector<xmlNode*> ChildElements(const xmlNode* element);
// Returns the first child element with this name, or null if the parent has no such child.
xmlNode* FirstChild(const xmlNode* parent, std::string_view namespaceUri,
                    std::string_view localName);

bool HasProcessingInstruction(const xmlDoc* document);

// The next element in document order, descendants included; null after the last one in `root`.
xmlNode* NextElement(const xmlNode* root, xmlNode* node);

// The elements of this name among `root` and its descendants.
std::vector<xmlNode*> FindElements(xmlNode* root, std::string_view namespaceUri,
                                   std::string_view localName);

// The value of the element's id attribute (ID, Id, AssertionID or wsu:Id); empty if it has no id.
std::string IdOf(const xmlNode* element);

// Registers every such attribute with the document, so that references find the elements.
void RegisterIds(xmlDoc* document);

}  // namespace DevSts

#endif
