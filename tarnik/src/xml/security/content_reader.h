#ifndef TARNIK_XML_SECURITY_CONTENT_READER_H
#define TARNIK_XML_SECURITY_CONTENT_READER_H

#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

#include <tarnik/xml/element_node.h>

namespace Tarnik::Xml::Security {

inline constexpr std::string_view kDsNamespace = "http://www.w3.org/2000/09/xmldsig#";
/// The elements that XML Signature 1.1 added.
inline constexpr std::string_view kDs11Namespace = "http://www.w3.org/2009/xmldsig11#";

/// True for text that contains only tabs, line feeds, carriage returns and blanks.
bool IsWhiteSpace(std::string_view text) noexcept;
/// `text` without the white space around it.
std::string_view Trim(std::string_view text) noexcept;

/// Returns the child elements of an element one after the other. Only white space and comments may
/// be between them; anything else is a `SignatureSyntaxException`.
class ContentReader {
 public:
  explicit ContentReader(const ElementNode* element);

  /// The current element, or null at the end.
  const ElementNode* Peek() const noexcept { return current_; }
  /// True when the current element has this name in the namespace of XML Signature.
  bool IsAt(std::string_view localName) const noexcept;
  /// Returns the current element and moves to the next one. Throws at the end.
  const ElementNode* TakeAny();
  /// As `TakeAny`, but throws unless the element has this name in the namespace of XML Signature.
  const ElementNode* Take(std::string_view localName);
  /// As `Take`, but returns null when the current element has another name, and at the end.
  const ElementNode* TakeIf(std::string_view localName);
  /// Throws unless all elements were taken.
  void ExpectEnd() const;

 private:
  void MoveTo(const Node* node);

  const ElementNode* parent_;
  const ElementNode* current_ = nullptr;
};

/// Throws `SignatureSyntaxException` unless each attribute is a namespace declaration or one of
/// `names`.
void ExpectAttributes(const ElementNode* element, std::initializer_list<std::string_view> names);
/// The value of the "Algorithm" attribute; no other attribute is allowed.
std::string AlgorithmOf(const ElementNode* element);
/// The trimmed text of an element. Throws `SignatureSyntaxException` when the element contains
/// anything but text, or a CDATA section.
std::string TextOf(const ElementNode* element);
/// The bytes of the element's text, decoded from Base64 (XML Schema Part 2, section 3.2.16). Throws
/// `SignatureSyntaxException` when it is not Base64 or empty.
std::vector<unsigned char> BytesOf(const ElementNode* element);

}  // namespace Tarnik::Xml::Security

#endif
