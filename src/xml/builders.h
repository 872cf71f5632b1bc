#ifndef SSOCLIENT_XML_BUILDERS_H
#define SSOCLIENT_XML_BUILDERS_H

#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <ssoclient/saml_token.h>
#include <tarnik/core/ref.h>
#include <tarnik/xml/element_node.h>

namespace SsoClient {

/// Describes one element with all that is in it. Immutable once assembled, so that one builder may
/// stand in several parents and be built from several threads at once.
class XMLBaseBuilder {
 public:
  XMLBaseBuilder() = default;
  XMLBaseBuilder(const XMLBaseBuilder&) = delete;
  XMLBaseBuilder& operator=(const XMLBaseBuilder&) = delete;

  /// Replaces what `out` held with the element. After an exception `out` may hold a part of it.
  virtual void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const = 0;
  virtual ~XMLBaseBuilder() = default;
};

/// Attributes as callers list them: qualified names and values. Namespace declarations are
/// attributes named "xmlns:p" among them.
using AttributeList = std::vector<std::pair<std::string, std::string>>;

/// Attributes as they are set on an element: in ascending byte order of their names.
using AttributeMap = std::map<std::string, std::string>;

/// Keeps the first value of a name that is given twice.
AttributeMap ToAttributeMap(const AttributeList& attributes);

/// An element with attributes and nothing in it.
class ElementBuilderImpl final : public XMLBaseBuilder {
 public:
  ElementBuilderImpl(std::string_view prefix, std::string_view localName,
                     const AttributeList& attributes);

  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  std::string prefix_;
  std::string localName_;
  AttributeMap attributes_;
};

/// Makes the element that both kinds of element builder start from. What the platform throws passes
/// unchanged: `Tarnik::InvalidArgumentException`, naming element and attribute but never the value,
/// when XML cannot carry a value.
void CreateElementWithAttributes(const std::string& prefix, const std::string& localName,
                                 const AttributeMap& attributes,
                                 Tarnik::Ref<Tarnik::Xml::ElementNode>& out);

/// An element whose only child is a text node, also when the text is empty. The text is cleansed
/// from memory when the builder dies, since it may be a password.
class TextElementBuilderImpl final : public XMLBaseBuilder {
 public:
  TextElementBuilderImpl(std::string_view prefix, std::string_view localName, std::string_view text,
                         const AttributeList& attributes);
  ~TextElementBuilderImpl() override;

  /// Passes on the platform's `Tarnik::InvalidArgumentException`, which names the element but never
  /// the text, when XML cannot carry the text.
  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  std::string prefix_;
  std::string localName_;
  AttributeMap attributes_;
  std::string text_;
};

/// An element that exists already. Each build hands out that very element, so it must not be built
/// into two trees at once: the later one takes it from the earlier.
class PreBuiltElementImpl final : public XMLBaseBuilder {
 public:
  explicit PreBuiltElementImpl(Tarnik::Ref<Tarnik::Xml::ElementNode> element);

  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  Tarnik::Ref<Tarnik::Xml::ElementNode> element_;
};

/// A root element with further children behind the root's own.
class XMLCompositeBuilder final : public XMLBaseBuilder {
 public:
  explicit XMLCompositeBuilder(std::shared_ptr<XMLBaseBuilder> root);

  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

  /// Appends a child; an empty pointer, an optional element that is left out, adds nothing. Only
  /// for the function that assembles this builder. Returns this builder.
  XMLCompositeBuilder& Add(std::shared_ptr<XMLBaseBuilder> child);

 private:
  std::shared_ptr<XMLBaseBuilder> root_;
  std::vector<std::shared_ptr<XMLBaseBuilder>> children_;
};

std::shared_ptr<XMLBaseBuilder> MakeElementBuilder(std::string_view prefix,
                                                   std::string_view localName);
std::shared_ptr<XMLBaseBuilder> MakeElementBuilder(std::string_view prefix,
                                                   std::string_view localName,
                                                   const AttributeList& attributes);

std::shared_ptr<XMLBaseBuilder> MakeTextElementBuilder(std::string_view prefix,
                                                       std::string_view localName,
                                                       std::string_view text);
std::shared_ptr<XMLBaseBuilder> MakeTextElementBuilder(std::string_view prefix,
                                                       std::string_view localName,
                                                       std::string_view text,
                                                       const AttributeList& attributes);

/// A composite rooted at a new element, to be filled with `Add`.
std::shared_ptr<XMLCompositeBuilder> MakeCompositeBuilder(std::string_view prefix,
                                                          std::string_view localName,
                                                          const AttributeList& attributes = {});

/// The token's root element, parsed anew from its text, so that a request carries the very bytes
/// that its issuer signed. Throws `Tarnik::Xml::XMLParseException` for a malformed text.
std::shared_ptr<XMLBaseBuilder> MakeTokenElementBuilder(const SamlToken& token);

}  // namespace SsoClient

#endif
