#ifndef TARNIK_XML_SECURITY_CONTENT_READER_H
#define TARNIK_XML_SECURITY_CONTENT_READER_H

#include <tarnik/xml/element_node.h>
#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

namespace Tarnik::Xml::Security {

inline constexpr std::string_view kDsNamespace = "http://www.w3.org/2000/09/xmldsig#";

/// True for text that holds nothing but tab, line feed, carriage return and blank.
bool IsWhiteSpace(std::string_view text) noexcept;
/// `text` without the white space around it.
std::string_view Trim(std::string_view text) noexcept;

/// Takes the child elements of an element one after the other. Only white space and comments may
/// stand between them; anything else is a `SignatureSyntaxException`.
class ContentReader {
 public:
  explicit ContentReader(const ElementNode* element);

  /// The current element, or null at the end.
  const ElementNode* Peek() const noexcept { return current_; }
  /// True when the current element has this name in XML-Signature's namespace.
  bool IsAt(std::string_view localName) const noexcept;
  /// Takes the current element, which there must be.
  const ElementNode* TakeAny();
  /// Takes the current element, which must have this name in XML-Signature's namespace.
  const ElementNode* Take(std::string_view localName);
  /// As `Take`, but null when the current element has another name.
  const ElementNode* TakeIf(std::string_view localName);
  /// Throws unless every element was taken.
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
/// The text of an element without attributes that holds only text and no CDATA section, without the
/// white space around it.
std::string TextOf(const ElementNode* element);
/// The bytes that the element's text gives in Base64 (XML Schema Part 2, section 3.2.16); at least
/// one.
std::vector<unsigned char> BytesOf(const ElementNode* element);

}  // namespace Tarnik::Xml::Security

#endif
