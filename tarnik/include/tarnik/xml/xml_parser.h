#ifndef TARNIK_XML_XML_PARSER_H
#define TARNIK_XML_XML_PARSER_H

#include <cstddef>
#include <string_view>

#include <tarnik/core/object.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>

namespace Tarnik::Xml {

/// Place in a document, counted from 1 (columns in bytes).
struct Position {
  unsigned long line;
  unsigned long column;
};

struct ParsedAttribute {
  std::string_view name;
  std::string_view value;
};

/// Receives what a parser finds, in document order. Views are valid only during the call. Used by
/// one parser, once. An exception leaves the parser unchanged.
class TARNIK_EXPORT XMLHandler : public virtual Object {
 public:
  virtual void StartElement(const Position& position, std::string_view name,
                            const ParsedAttribute* attributes, std::size_t count) = 0;
  virtual void EndElement(const Position& position) = 0;
  /// Character data; one run of text may come in several calls.
  virtual void Characters(const Position& position, std::string_view text) = 0;
  virtual void Comment(const Position& position, std::string_view text) = 0;
  virtual void ProcessingInstruction(const Position& position, std::string_view target,
                                     std::string_view text) = 0;
  /// The end of a well-formed document; gives what the handler has made of it.
  virtual Ref<Object> EndDocument() = 0;
  /// The start of a CDATA section, whose characters come as any other. Does nothing by default.
  virtual void StartCDataSection(const Position&) {}
};

/// A handler that builds a `Document` and checks what Namespaces in XML 1.0 demands: every prefix
/// is bound, no two attributes of an element share an expanded name, and "xml" and "xmlns" are used
/// rightly. It also refuses an element when that element and those around it have more than
/// `kMaxOpenAttributes` attributes, so that looking a namespace up in the tree stays cheap.
TARNIK_EXPORT Ref<XMLHandler> CreateXMLDocumentHandler();

/// How many attributes, namespace declarations included, the elements from the root of a parsed
/// document to any one element may have together.
inline constexpr std::size_t kMaxOpenAttributes = 1024;

/// What no parsed document may exceed.
inline constexpr std::size_t kMaxElementDepth = 256;
inline constexpr std::size_t kMaxDocumentBytes = std::size_t{16} * 1024 * 1024;

/// Reads one XML 1.0 document from a reader.
class TARNIK_EXPORT XMLParser : public virtual Object {
 public:
  /// Parses to the end and returns what the handler made. Called once.
  ///
  /// Throws `XMLParseException` with the place of the fault when the document is not well-formed,
  /// is not UTF-8 (with or without a byte order mark), holds a DOCTYPE, nests deeper than
  /// `kMaxElementDepth`, or is longer than `kMaxDocumentBytes`.
  virtual Ref<Object> Parse() = 0;
};

TARNIK_EXPORT Ref<XMLParser> CreateXMLParser(Reader* reader, XMLHandler* handler);

}  // namespace Tarnik::Xml

#endif
