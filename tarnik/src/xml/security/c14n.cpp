#include "xml/security/c14n.h"

#include <algorithm>
#include <cstddef>
#include <functional>

#include <tarnik/core/exception.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "support/ascii.h"
#include "support/quote.h"
#include "xml/namespace_scope.h"
#include "xml/namespaces.h"
#include "xml/output_buffer.h"
#include "xml/tree_builder.h"

namespace Tarnik::Xml::Security {

namespace {

constexpr std::string_view kInclusive = "http://www.w3.org/TR/2001/REC-xml-c14n-20010315";
constexpr std::string_view kInclusiveFragment = "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#";
constexpr std::string_view kInclusiveWithComments =
    "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#WithComments";
constexpr std::string_view kExclusive = "http://www.w3.org/2001/10/xml-exc-c14n#";
constexpr std::string_view kExclusiveWithComments =
    "http://www.w3.org/2001/10/xml-exc-c14n#WithComments";

constexpr bool IsSchemeCharacter(char character) noexcept {
  return IsLetter(character) || IsDigit(character) || character == '+' || character == '-' ||
         character == '.';
}

// RFC 3986, section 4.2: a relative reference has no scheme.
bool HasScheme(std::string_view uri) noexcept {
  if (uri.empty() || !IsLetter(uri.front())) {
    return false;
  }
  const auto end = std::find_if_not(uri.begin(), uri.end(), IsSchemeCharacter);
  return end != uri.end() && *end == ':';
}

/// One canonicalisation. For each prefix in scope the walk keeps the binding of the input and the
/// binding of the output so far. Both methods write a declaration exactly when the two differ; they
/// differ only in the prefixes that they check.
class CanonicalWalk {
 public:
  CanonicalWalk(const C14nOptions& options, Writer& writer)
      : options_(options),
        inclusivePrefixes_(options.inclusivePrefixes.begin(), options.inclusivePrefixes.end()),
        output_(writer) {
    std::sort(inclusivePrefixes_.begin(), inclusivePrefixes_.end());
    declarations_.reserve(16);
    attributes_.reserve(16);
  }

  void Run(const Node& apex, const ElementNode* omitted);

 private:
  struct Declaration {
    std::string_view prefix;
    std::string_view uri;
  };
  struct SortedAttribute {
    std::string_view uri;
    std::string_view local;
    const Attribute* attribute;
  };

  void WalkElement(const ElementNode& apex, const ElementNode* omitted);
  void WriteDocument(const Document& document, const ElementNode* omitted);
  void WriteLeaf(const Node& node);
  void WriteStartTag(const ElementNode& element);
  void WriteEndTag(const ElementNode& element);

  void EnterContext(const ElementNode& apex);
  void InheritXmlAttributes(const ElementNode& apex);
  void Declare(const ElementNode& element);
  void CollectDeclarations(const ElementNode& element);
  void CollectAttributes(const ElementNode& element);
  void SortAttributes();
  void Use(std::string_view prefix, const ElementNode& element);
  void UseInclusive(std::string_view prefix);
  void Render(NamespaceScope::Binding& binding);
  bool IsInclusive(std::string_view prefix) const noexcept;

  const C14nOptions& options_;
  std::vector<std::string_view> inclusivePrefixes_;
  OutputBuffer output_;
  NamespaceScope scope_;
  unsigned depth_ = 0;
  bool atApex_ = true;
  std::vector<Declaration> declarations_;
  std::vector<SortedAttribute> attributes_;
  std::vector<const Attribute*> inherited_;
};

void CanonicalWalk::Run(const Node& apex, const ElementNode* omitted) {
  if (apex.Kind() == NodeKind::kDocument) {
    WriteDocument(static_cast<const Document&>(apex), omitted);
  } else {
    const auto& element = static_cast<const ElementNode&>(apex);
    EnterContext(element);
    WalkElement(element, omitted);
  }
  output_.Flush();
}

// Canonical XML 1.0, section 2.3, "Processing Instruction Nodes" and "Comment Nodes": a line feed
// separates the root element from the nodes around it.
void CanonicalWalk::WriteDocument(const Document& document, const ElementNode* omitted) {
  bool afterRoot = false;
  for (const Node* node = document.FirstChild(); node != nullptr; node = node->NextSibling()) {
    if (node->Kind() == NodeKind::kElement) {
      WalkElement(static_cast<const ElementNode&>(*node), omitted);
      afterRoot = true;
      continue;
    }
    if (node->Kind() == NodeKind::kComment && !options_.withComments) {
      continue;
    }
    if (afterRoot) {
      output_.Append('\n');
    }
    WriteLeaf(*node);
    if (!afterRoot) {
      output_.Append('\n');
    }
  }
}

void CanonicalWalk::WalkElement(const ElementNode& apex, const ElementNode* omitted) {
  if (&apex == omitted) {
    return;
  }
  WriteStartTag(apex);
  const ElementNode* parent = &apex;
  const Node* node = apex.FirstChild();
  // Iterative, since trees that callers build may be as deep as memory allows.
  while (true) {
    if (node == nullptr) {
      WriteEndTag(*parent);
      if (parent == &apex) {
        return;
      }
      node = parent->NextSibling();
      parent = parent->ParentElement();
      continue;
    }
    if (node->Kind() != NodeKind::kElement) {
      WriteLeaf(*node);
      node = node->NextSibling();
      continue;
    }
    if (node == omitted) {
      node = node->NextSibling();
      continue;
    }
    parent = static_cast<const ElementNode*>(node);
    WriteStartTag(*parent);
    node = parent->FirstChild();
  }
}

void CanonicalWalk::WriteLeaf(const Node& node) {
  switch (node.Kind()) {
    case NodeKind::kText:
      output_.AppendText(static_cast<const TextNode&>(node).Text());
      return;
    case NodeKind::kComment:
      if (options_.withComments) {
        output_.AppendComment(static_cast<const CommentNode&>(node).Text());
      }
      return;
    case NodeKind::kProcessingInstruction: {
      const auto& instruction = static_cast<const ProcessingInstructionNode&>(node);
      output_.AppendProcessingInstruction(instruction.Target(), instruction.Text());
      return;
    }
    default:
      return;
  }
}

void CanonicalWalk::WriteStartTag(const ElementNode& element) {
  ++depth_;
  if (TreeBuilder::DeclaresNamespaces(element)) {
    Declare(element);
  }
  CollectAttributes(element);
  CollectDeclarations(element);
  output_.Append('<');
  output_.Append(TreeBuilder::NameOf(element).Full());
  for (const Declaration& declaration : declarations_) {
    output_.Append(declaration.prefix.empty() ? " xmlns" : " xmlns:");
    output_.Append(declaration.prefix);
    output_.Append("=\"");
    output_.AppendAttributeValue(declaration.uri);
    output_.Append('"');
  }
  for (const SortedAttribute& sorted : attributes_) {
    output_.Append(' ');
    output_.Append(TreeBuilder::NameOf(*sorted.attribute).Full());
    output_.Append("=\"");
    output_.AppendAttributeValue(sorted.attribute->Value());
    output_.Append('"');
  }
  output_.Append('>');
  atApex_ = false;
}

void CanonicalWalk::WriteEndTag(const ElementNode& element) {
  output_.Append("</");
  output_.Append(TreeBuilder::NameOf(element).Full());
  output_.Append('>');
  scope_.PopTo(depth_);
  --depth_;
}

// An element inside a document is a subset of it, so the bindings of its ancestors are in scope.
void CanonicalWalk::EnterContext(const ElementNode& apex) {
  std::vector<const ElementNode*> ancestors;
  for (const ElementNode* up = apex.ParentElement(); up != nullptr; up = up->ParentElement()) {
    ancestors.push_back(up);
  }
  std::for_each(ancestors.rbegin(), ancestors.rend(), [this](const ElementNode* ancestor) {
    ++depth_;
    Declare(*ancestor);
  });
  if (!options_.exclusive) {
    InheritXmlAttributes(apex);
  }
}

// Canonical XML 1.0, section 2.4: of each attribute in the xml namespace, the nearest one. Sorted,
// so that many of them do not take quadratic time.
void CanonicalWalk::InheritXmlAttributes(const ElementNode& apex) {
  for (const ElementNode* up = &apex; up != nullptr; up = up->ParentElement()) {
    for (std::size_t index = 0; index < up->AttributeCount(); ++index) {
      const Attribute& attribute = up->AttributeAt(index);
      if (TreeBuilder::NameOf(attribute).Prefix() == "xml") {
        inherited_.push_back(&attribute);
      }
    }
  }
  std::stable_sort(inherited_.begin(), inherited_.end(),
                   [](const Attribute* a, const Attribute* b) { return a->Name() < b->Name(); });
  const auto end =
      std::unique(inherited_.begin(), inherited_.end(),
                  [](const Attribute* a, const Attribute* b) { return a->Name() == b->Name(); });
  inherited_.erase(end, inherited_.end());
  const Attribute* const own = TreeBuilder::AttributesOf(apex);
  const Attribute* const ownEnd = own + TreeBuilder::AttributeCountOf(apex);
  std::erase_if(inherited_, [own, ownEnd](const Attribute* attribute) {
    return !std::less<>()(attribute, own) && std::less<>()(attribute, ownEnd);
  });
}

void CanonicalWalk::Declare(const ElementNode& element) {
  const std::size_t count = TreeBuilder::AttributeCountOf(element);
  for (std::size_t index = 0; index < count; ++index) {
    const Attribute& attribute = TreeBuilder::AttributesOf(element)[index];
    const InternedName& name = TreeBuilder::NameOf(attribute);
    const std::string_view prefix = name.DeclaredPrefix();
    // The prefix "xml" needs no declaration, and the canonical form never has one.
    if (!name.isDeclaration || prefix == "xml") {
      continue;
    }
    const std::string_view uri = attribute.Value();
    if (!uri.empty() && !HasScheme(uri)) {
      throw XmlSecurityException("Element " + QuoteVerbatim(element.QualifiedNameText()) +
                                 " declares a namespace with a relative URI.");
    }
    const NamespaceScope::Binding* outer = scope_.Find(prefix);
    scope_.Push({prefix, uri, outer == nullptr ? std::string_view() : outer->rendered, depth_});
  }
}

// Canonical XML 1.0, section 2.3, "Namespace Axis"; Exclusive XML Canonicalization 1.0, section 3.
void CanonicalWalk::CollectDeclarations(const ElementNode& element) {
  declarations_.clear();
  if (options_.exclusive) {
    Use(TreeBuilder::NameOf(element).Prefix(), element);
    for (const SortedAttribute& sorted : attributes_) {
      const std::string_view prefix = TreeBuilder::NameOf(*sorted.attribute).Prefix();
      if (!prefix.empty()) {
        Use(prefix, element);
      }
    }
  }
  const bool anyInclusive = !options_.exclusive || !options_.inclusivePrefixes.empty();
  if (anyInclusive && (atApex_ || TreeBuilder::DeclaresNamespaces(element))) {
    // Iterated by index, since rendering may append bindings.
    for (std::size_t index = scope_.Size(); index > 0; --index) {
      const NamespaceScope::Binding& binding = scope_.At(index - 1);
      if (!atApex_ && binding.depth < depth_) {
        break;
      }
      if (IsInclusive(binding.prefix)) {
        UseInclusive(binding.prefix);
      }
    }
  }
  if (declarations_.size() > 1) {
    std::sort(declarations_.begin(), declarations_.end(),
              [](const Declaration& a, const Declaration& b) { return a.prefix < b.prefix; });
  }
}

void CanonicalWalk::Use(std::string_view prefix, const ElementNode& element) {
  NamespaceScope::Binding* binding = scope_.Find(prefix);
  if (binding != nullptr) {
    Render(*binding);
    return;
  }
  if (!prefix.empty() && prefix != "xml") {
    throw XmlSecurityException("The prefix " + QuoteVerbatim(prefix) + " at element " +
                               QuoteVerbatim(element.QualifiedNameText()) + " is not bound.");
  }
}

void CanonicalWalk::UseInclusive(std::string_view prefix) {
  NamespaceScope::Binding* binding = scope_.Find(prefix);
  if (binding != nullptr) {
    Render(*binding);
  }
}

// An empty default namespace is rendered only to override another one.
void CanonicalWalk::Render(NamespaceScope::Binding& binding) {
  if (binding.rendered == binding.uri) {
    return;
  }
  declarations_.push_back({binding.prefix, binding.uri});
  if (binding.depth == depth_) {
    binding.rendered = binding.uri;
    return;
  }
  scope_.Push({binding.prefix, binding.uri, binding.uri, depth_});
}

bool CanonicalWalk::IsInclusive(std::string_view prefix) const noexcept {
  if (!options_.exclusive) {
    return true;
  }
  const std::string_view listed = prefix.empty() ? "#default" : prefix;
  return std::binary_search(inclusivePrefixes_.begin(), inclusivePrefixes_.end(), listed);
}

void CanonicalWalk::CollectAttributes(const ElementNode& element) {
  attributes_.clear();
  const Attribute* const attributes = TreeBuilder::AttributesOf(element);
  const std::size_t count = TreeBuilder::AttributeCountOf(element);
  for (std::size_t index = 0; index < count; ++index) {
    const InternedName& name = TreeBuilder::NameOf(attributes[index]);
    if (!name.isDeclaration) {
      attributes_.push_back({{}, name.Local(), &attributes[index]});
    }
  }
  if (atApex_) {
    for (const Attribute* attribute : inherited_) {
      attributes_.push_back({{}, TreeBuilder::NameOf(*attribute).Local(), attribute});
    }
  }
  if (attributes_.size() > 1) {
    SortAttributes();
  }
}

// Canonical XML 1.0, section 2.2: by namespace URI, then by local name.
void CanonicalWalk::SortAttributes() {
  for (SortedAttribute& sorted : attributes_) {
    const std::string_view prefix = TreeBuilder::NameOf(*sorted.attribute).Prefix();
    if (prefix.empty()) {
      continue;
    }
    const NamespaceScope::Binding* binding = scope_.Find(prefix);
    sorted.uri = prefix == "xml"      ? kXmlNamespace
                 : binding != nullptr ? binding->uri
                                      : std::string_view();
  }
  std::sort(attributes_.begin(), attributes_.end(),
            [](const SortedAttribute& a, const SortedAttribute& b) {
              const int order = a.uri.compare(b.uri);
              return order != 0 ? order < 0 : a.local < b.local;
            });
}

}  // namespace

bool ReadC14nAlgorithm(std::string_view algorithm, C14nOptions& options) noexcept {
  const bool inclusive = algorithm == kInclusive || algorithm == kInclusiveFragment;
  const bool inclusiveWithComments = algorithm == kInclusiveWithComments;
  const bool exclusive = algorithm == kExclusive;
  const bool exclusiveWithComments = algorithm == kExclusiveWithComments;
  options.exclusive = exclusive || exclusiveWithComments;
  options.withComments = inclusiveWithComments || exclusiveWithComments;
  return inclusive || inclusiveWithComments || exclusive || exclusiveWithComments;
}

void WriteCanonical(const Node* node, const ElementNode* omitted, const C14nOptions& options,
                    Writer& writer) {
  const bool valid = node != nullptr &&
                     (node->Kind() == NodeKind::kDocument || node->Kind() == NodeKind::kElement);
  if (!valid) {
    throw InvalidArgumentException("Only a document or an element has a canonical form.");
  }
  CanonicalWalk(options, writer).Run(*node, omitted);
}

}  // namespace Tarnik::Xml::Security
