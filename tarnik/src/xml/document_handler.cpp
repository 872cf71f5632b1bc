#include <algorithm>
#include <string>
#include <utility>
#include <vector>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/xml_parse_exception.h>
#include <tarnik/xml/xml_parser.h>

#include "support/quote.h"
#include "xml/name_cache.h"
#include "xml/namespace_scope.h"
#include "xml/namespaces.h"
#include "xml/tree_builder.h"
#include "xml/xml_chars.h"

namespace Tarnik::Xml {

namespace {

class DocumentHandler final : public XMLHandler, public ObjectImpl {
 public:
  DocumentHandler()
      : tree_(Tree::Create(Tree::kDocumentBlockBytes)),
        document_(TreeBuilder::NewDocument(*tree_)),
        current_(document_.get()) {}

  ~DocumentHandler() override { StringUtil::Cleanse(pendingText_); }

  void StartElement(const Position& position, std::string_view name,
                    const ParsedAttribute* attributes, std::size_t count) override;
  void EndElement(const Position& position) override;
  void Characters(const Position& position, std::string_view text) override;
  void Comment(const Position& position, std::string_view text) override;
  void ProcessingInstruction(const Position& position, std::string_view target,
                             std::string_view text) override;
  Ref<Object> EndDocument() override;
  void StartCDataSection(const Position& position) override;

 private:
  struct ExpandedName {
    std::string_view uri;
    std::string_view local;
    bool operator==(const ExpandedName& other) const noexcept {
      return local == other.local && uri == other.uri;
    }
    bool operator<(const ExpandedName& other) const noexcept {
      const int order = local.compare(other.local);
      return order != 0 ? order < 0 : uri < other.uri;
    }
  };

  ParentNode& Current() const;
  void Add(Node* node, const Position& position) noexcept;
  void FlushText();
  const InternedName* Intern(std::string_view name, const Position& position);
  void Declare(const InternedName& name, std::string_view uri, const Position& position);
  std::string_view Resolve(std::string_view prefix, const Position& position);
  void CheckAttributeNames(const ElementNode& element, const Position& position);
  bool HasDuplicate();

  Tree::Holder tree_;
  Ref<Document> document_;
  ParentNode* current_;
  unsigned depth_ = 0;
  std::size_t openAttributes_ = 0;
  NameCache names_;
  NamespaceScope scope_;
  std::string pendingText_;
  Position pendingPosition_{};
  bool pendingCDataSection_ = false;
  std::vector<ExpandedName> expandedNames_;
};

ParentNode& DocumentHandler::Current() const {
  if (current_ == nullptr) {
    throw InvalidStateException("The document is complete: a handler is used once.");
  }
  return *current_;
}

void DocumentHandler::Add(Node* node, const Position& position) noexcept {
  TreeBuilder::SetPosition(*node, position);
  TreeBuilder::Append(*current_, *node);
}

void DocumentHandler::FlushText() {
  const bool hasCDataSection = std::exchange(pendingCDataSection_, false);
  if (pendingText_.empty()) {
    return;
  }
  TextNode* text = TreeBuilder::NewText(*tree_, pendingText_);
  if (hasCDataSection) {
    TreeBuilder::MarkCDataSection(*text);
  }
  Add(text, pendingPosition_);
  pendingText_.clear();
}

void DocumentHandler::StartElement(const Position& position, std::string_view name,
                                   const ParsedAttribute* attributes, std::size_t count) {
  Current();
  openAttributes_ += count;
  if (openAttributes_ > kMaxOpenAttributes) {
    throw XMLParseException("An element and those around it have more than " +
                                std::to_string(kMaxOpenAttributes) + " attributes",
                            position);
  }
  FlushText();
  const InternedName* elementName = Intern(name, position);
  ElementNode* element = TreeBuilder::NewElement(*tree_, elementName);
  ++depth_;
  if (count > 0) {
    TreeBuilder::ReserveAttributes(*element, *tree_, count);
  }
  bool prefixed = false;
  for (std::size_t index = 0; index < count; ++index) {
    const InternedName* attributeName = Intern(attributes[index].name, position);
    const std::string_view value = tree_->Store(attributes[index].value);
    TreeBuilder::PutAttribute(*element, attributeName, value);
    if (attributeName->isDeclaration) {
      Declare(*attributeName, value, position);
    } else {
      prefixed = prefixed || attributeName->prefixLength != 0;
    }
  }
  if (elementName->Prefix() == "xmlns") {
    throw XMLParseException("The prefix 'xmlns' is not for elements", position);
  }
  Resolve(elementName->Prefix(), position);
  if (prefixed) {
    CheckAttributeNames(*element, position);
  }
  Add(element, position);
  current_ = element;
}

void DocumentHandler::EndElement(const Position&) {
  if (Current().Kind() == NodeKind::kDocument) {
    throw InvalidStateException("There is no open element to end.");
  }
  FlushText();
  scope_.PopTo(depth_);
  --depth_;
  openAttributes_ -= TreeBuilder::AttributeCountOf(static_cast<const ElementNode&>(*current_));
  current_ = current_->Parent();
}

void DocumentHandler::Characters(const Position& position, std::string_view text) {
  if (Current().Kind() == NodeKind::kDocument) {
    throw InvalidStateException("There is no open element for a text.");
  }
  if (pendingText_.empty()) {
    pendingPosition_ = position;
  }
  pendingText_.append(text);
}

void DocumentHandler::StartCDataSection(const Position&) {
  Current();
  pendingCDataSection_ = true;
}

void DocumentHandler::Comment(const Position& position, std::string_view text) {
  Current();
  FlushText();
  Add(TreeBuilder::NewComment(*tree_, text), position);
}

void DocumentHandler::ProcessingInstruction(const Position& position, std::string_view target,
                                            std::string_view text) {
  Current();
  // Namespaces in XML 1.0, section 7: no processing instruction target contains a colon.
  if (target.find(':') != std::string_view::npos) {
    throw XMLParseException(
        "The processing instruction target " + QuoteVerbatim(target) + " holds a colon", position);
  }
  FlushText();
  Add(TreeBuilder::NewProcessingInstruction(*tree_, target, text), position);
}

Ref<Object> DocumentHandler::EndDocument() {
  if (Current().Kind() != NodeKind::kDocument || document_->RootElement() == nullptr) {
    throw InvalidStateException("The document is not complete.");
  }
  current_ = nullptr;
  return Ref<Object>(std::move(document_));
}

const InternedName* DocumentHandler::Intern(std::string_view name, const Position& position) {
  const InternedName*& slot = names_.SlotOf(name);
  if (slot != nullptr && slot->Full() == name) {
    return slot;
  }
  if (name.find(':') != std::string_view::npos && !IsQualifiedName(name)) {
    throw XMLParseException("The name " + QuoteVerbatim(name) + " is not a qualified name",
                            position);
  }
  slot = tree_->StoreName(name);
  return slot;
}

// Namespaces in XML 1.0, section 3, "Reserved Prefixes and Namespace Names", and section 2.2 for
// the empty name of a prefixed declaration.
void DocumentHandler::Declare(const InternedName& name, std::string_view uri,
                              const Position& position) {
  const std::string_view prefix = name.DeclaredPrefix();
  if (prefix == "xmlns" || uri == kXmlnsNamespace) {
    throw XMLParseException("Neither the prefix 'xmlns' nor its namespace can be declared",
                            position);
  }
  if ((prefix == "xml") != (uri == kXmlNamespace)) {
    throw XMLParseException("The prefix 'xml' and its namespace belong only to each other",
                            position);
  }
  if (uri.empty() && !prefix.empty()) {
    throw XMLParseException("The prefix " + QuoteVerbatim(prefix) + " is declared as no namespace",
                            position);
  }
  scope_.Push({prefix, uri, {}, depth_});
}

std::string_view DocumentHandler::Resolve(std::string_view prefix, const Position& position) {
  if (prefix == "xml") {
    return kXmlNamespace;
  }
  const NamespaceScope::Binding* binding = scope_.Find(prefix);
  if (binding != nullptr) {
    return binding->uri;
  }
  if (!prefix.empty()) {
    throw XMLParseException("The prefix " + QuoteVerbatim(prefix) + " is not bound to a namespace",
                            position);
  }
  return {};
}

// Namespaces in XML 1.0, section 6.3. Only attributes with a prefix are compared: those without one
// are in no namespace, and the parser itself rejects duplicates of them.
void DocumentHandler::CheckAttributeNames(const ElementNode& element, const Position& position) {
  expandedNames_.clear();
  const Attribute* const attributes = TreeBuilder::AttributesOf(element);
  for (std::size_t index = 0; index < TreeBuilder::AttributeCountOf(element); ++index) {
    const InternedName& name = TreeBuilder::NameOf(attributes[index]);
    if (name.prefixLength != 0 && !name.isDeclaration) {
      expandedNames_.push_back({Resolve(name.Prefix(), position), name.Local()});
    }
  }
  if (expandedNames_.size() > 1 && HasDuplicate()) {
    throw XMLParseException("Two attributes of element " +
                                QuoteVerbatim(element.QualifiedNameText()) +
                                " have the same name in one namespace",
                            position);
  }
}

bool DocumentHandler::HasDuplicate() {
  std::sort(expandedNames_.begin(), expandedNames_.end());
  return std::adjacent_find(expandedNames_.begin(), expandedNames_.end()) != expandedNames_.end();
}

}  // namespace

Ref<XMLHandler> CreateXMLDocumentHandler() {
  return MakeRef<DocumentHandler>();
}

}  // namespace Tarnik::Xml
