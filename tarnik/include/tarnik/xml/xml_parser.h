#ifndef TARNIK_XML_XML_PARSER_H
#define TARNIK_XML_XML_PARSER_H

#include <cstddef>
#include <string_view>

#include <tarnik/core/object.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>

namespace Tarnik::Xml {

/// Position in a document, counted from 1 (columns in bytes).
struct Position {
  unsigned long line;    ///< from 1
  unsigned long column;  ///< from 1
};

/// An attribute as it was read. Namespace declarations are attributes, too.
struct ParsedAttribute {
  std::string_view name;   ///< the qualified name
  std::string_view value;  ///< normalised and unescaped
};

/// Receives the content of a document in document order. Views are valid only during the call. Used
/// by one parser, once. An exception passes through the parser unchanged.
class TARNIK_EXPORT XMLHandler : public virtual Object {
 public:
  /// The start of an element with `count` attributes, in the order in which they are written.
  virtual void StartElement(const Position& position, std::string_view name,
                            const ParsedAttribute* attributes, std::size_t count) = 0;
  /// The end of the element that was started last and has not ended.
  virtual void EndElement(const Position& position) = 0;
  /// Character data; one text may be reported in several calls.
  virtual void Characters(const Position& position, std::string_view text) = 0;
  /// A comment: the characters between "<!--" and "-->".
  virtual void Comment(const Position& position, std::string_view text) = 0;
  /// A processing instruction: the name after "<?", and what follows it.
  virtual void ProcessingInstruction(const Position& position, std::string_view target,
                                     std::string_view text) = 0;
  /// The end of a well-formed document; returns the handler's result.
  virtual Ref<Object> EndDocument() = 0;
  /// The start of a CDATA section, whose characters are reported like any others. Does nothing by
  /// default.
  virtual void StartCDataSection(const Position&) {}
};

/// A handler that builds a `Document` and checks the rules of Namespaces in XML 1.0: every prefix
/// is bound, no two attributes of an element have the same expanded name, and "xml" and "xmlns" are
/// used correctly. It also rejects an element when that element and those around it have more than
/// `kMaxOpenAttributes` attributes, so that looking up a namespace in the tree stays cheap.
TARNIK_EXPORT Ref<XMLHandler> CreateXMLDocumentHandler();

/// The maximum number of attributes, including namespace declarations, that an element of a parsed
/// document and all elements around it may have together.
inline constexpr std::size_t kMaxOpenAttributes = 1024;

/// The largest number of elements that contain one another.
inline constexpr std::size_t kMaxElementDepth = 256;
/// The longest document, in bytes.
inline constexpr std::size_t kMaxDocumentBytes = std::size_t{16} * 1024 * 1024;

/// Reads one XML 1.0 document from a reader. Names consist of the characters of XML 1.0, fourth
/// edition (appendix B); `CreateElementNode` and `ElementNode::SetAttribute` accept the same names.
class TARNIK_EXPORT XMLParser : public virtual Object {
 public:
  /// Parses the document to its end and returns the handler's result. Called once.
  ///
  /// Throws `XMLParseException` with the position of the fault when the document is not
  /// well-formed, declares another version than 1.0, is not UTF-8 (with or without a byte order
  /// mark), has a DOCTYPE, nests deeper than `kMaxElementDepth`, or is longer than
  /// `kMaxDocumentBytes`.
  virtual Ref<Object> Parse() = 0;
};

/// A parser that reads from `reader` and reports to `handler`, both of which it keeps alive.
TARNIK_EXPORT Ref<XMLParser> CreateXMLParser(Reader* reader, XMLHandler* handler);

}  // namespace Tarnik::Xml

#endif
