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

#include "support/secret_text.h"

namespace SsoClient {

/// Describes one element with all its content. Immutable once assembled, so that one builder may be
/// part of several parents and several threads may build it at once.
class XMLBaseBuilder {
 public:
  XMLBaseBuilder() = default;
  XMLBaseBuilder(const XMLBaseBuilder&) = delete;
  XMLBaseBuilder& operator=(const XMLBaseBuilder&) = delete;

  /// Replaces `out` with the element. After an exception `out` may hold an incomplete element.
  virtual void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const = 0;
  virtual ~XMLBaseBuilder() = default;
};

/// Attributes as callers list them: qualified names and values. A namespace declaration is an
/// attribute named "xmlns:p".
using AttributeList = std::vector<std::pair<std::string, std::string>>;

/// Attributes as they are set on an element: in ascending byte order of their names.
using AttributeMap = std::map<std::string, std::string>;

/// Keeps the first value of a name that is given twice.
AttributeMap ToAttributeMap(const AttributeList& attributes);

/// Creates the element that both kinds of element builder start from. Passes on the platform's
/// `Tarnik::InvalidArgumentException` when XML cannot represent a value; the exception names the
/// element and the attribute but never the value.
void CreateElementWithAttributes(const std::string& prefix, const std::string& localName,
                                 const AttributeMap& attributes,
                                 Tarnik::Ref<Tarnik::Xml::ElementNode>& out);

/// An element with attributes and no content.
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

/// An element whose only child is a text node, also when the text is empty. The text may be a
/// password: it is cleansed from memory when the builder is destroyed.
class TextElementBuilderImpl final : public XMLBaseBuilder {
 public:
  TextElementBuilderImpl(std::string_view prefix, std::string_view localName, std::string_view text,
                         const AttributeList& attributes);

  /// Passes on the platform's `Tarnik::InvalidArgumentException` when XML cannot represent the
  /// text; the exception names the element but never the text.
  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  std::string prefix_;
  std::string localName_;
  AttributeMap attributes_;
  SecretText text_;
};

/// An element that exists already. Each build returns that same element, so it must not be built
/// into two trees at once: the second tree would take it from the first.
class PreBuiltElementImpl final : public XMLBaseBuilder {
 public:
  explicit PreBuiltElementImpl(Tarnik::Ref<Tarnik::Xml::ElementNode> element);

  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  Tarnik::Ref<Tarnik::Xml::ElementNode> element_;
};

/// A root element with more children after the root's own.
class XMLCompositeBuilder final : public XMLBaseBuilder {
 public:
  explicit XMLCompositeBuilder(std::shared_ptr<XMLBaseBuilder> root);

  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

  /// Appends a child and returns this builder. A null child, an optional element that is left out,
  /// adds nothing. Only for the function that assembles this builder.
  XMLCompositeBuilder& Add(std::shared_ptr<XMLBaseBuilder> child);

 private:
  std::shared_ptr<XMLBaseBuilder> root_;
  std::vector<std::shared_ptr<XMLBaseBuilder>> children_;
};

std::shared_ptr<XMLBaseBuilder> MakeElementBuilder(std::string_view prefix,
                                                   std::string_view localName,
                                                   const AttributeList& attributes = {});

std::shared_ptr<XMLBaseBuilder> MakeTextElementBuilder(std::string_view prefix,
                                                       std::string_view localName,
                                                       std::string_view text,
                                                       const AttributeList& attributes = {});

/// A composite with a new element as its root, to be filled with `Add`.
std::shared_ptr<XMLCompositeBuilder> MakeCompositeBuilder(std::string_view prefix,
                                                          std::string_view localName,
                                                          const AttributeList& attributes = {});

/// The token's root element, parsed from its text, so that a request contains the bytes that the
/// issuer signed. Throws `Tarnik::Xml::XMLParseException` for malformed text.
std::shared_ptr<XMLBaseBuilder> MakeTokenElementBuilder(const SamlToken& token);

}  // namespace SsoClient

#endif
