#ifndef TARNIK_XML_CHARACTER_NODES_H
#define TARNIK_XML_CHARACTER_NODES_H

#include <string_view>

#include <tarnik/xml/node.h>

namespace Tarnik::Xml {

/// Character data. Adjacent pieces and CDATA sections of a parsed document form one text node.
class TARNIK_EXPORT TextNode final : public Node {
 public:
  /// The characters, unescaped, in UTF-8.
  std::string_view Text() const noexcept { return {text_, length_}; }
  /// True when the text contains a CDATA section, possibly an empty one, in the parsed document.
  bool HasCDataSection() const noexcept { return hasCDataSection_ != 0; }
  /// Sets the text, which then has no CDATA section. Throws `InvalidArgumentException` for text
  /// that XML 1.0 does not allow (section 2.2).
  void SetText(std::string_view text);

 private:
  friend class Tree;
  friend class TreeBuilder;
  using Node::Node;
  const char* text_ = "";
  std::size_t length_ = 0;
};

/// A comment. Found only in parsed documents.
class TARNIK_EXPORT CommentNode final : public Node {
 public:
  /// The characters between "<!--" and "-->".
  std::string_view Text() const noexcept { return {text_, length_}; }

 private:
  friend class Tree;
  friend class TreeBuilder;
  using Node::Node;
  const char* text_ = "";
  std::size_t length_ = 0;
};

/// A processing instruction. Found only in parsed documents.
class TARNIK_EXPORT ProcessingInstructionNode final : public Node {
 public:
  /// The name after "<?".
  std::string_view Target() const noexcept { return {target_, targetLength_}; }
  /// What follows the target and white space, up to "?>".
  std::string_view Text() const noexcept { return {text_, length_}; }

 private:
  friend class Tree;
  friend class TreeBuilder;
  using Node::Node;
  const char* target_ = "";
  const char* text_ = "";
  std::size_t targetLength_ = 0;
  std::size_t length_ = 0;
};

/// Creates an empty text node.
TARNIK_EXPORT void CreateTextNode(Ref<TextNode>& text);

}  // namespace Tarnik::Xml

#endif
