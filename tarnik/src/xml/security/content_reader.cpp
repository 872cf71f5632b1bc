#include "xml/security/content_reader.h"

#include <algorithm>

#include <tarnik/core/exception.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "support/quote.h"

namespace Tarnik::Xml::Security {
namespace {

constexpr std::string_view kWhiteSpace = "\t\n\r ";

[[noreturn]] void Refuse(const ElementNode* element, const std::string& what) {
  throw SignatureSyntaxException("Element " + Quote(element->QualifiedNameText()) + " " + what +
                                 ".");
}

}  // namespace

bool IsWhiteSpace(std::string_view text) noexcept {
  return text.find_first_not_of(kWhiteSpace) == std::string_view::npos;
}

std::string_view Trim(std::string_view text) noexcept {
  const std::size_t first = text.find_first_not_of(kWhiteSpace);
  if (first == std::string_view::npos) {
    return {};
  }
  return text.substr(first, text.find_last_not_of(kWhiteSpace) - first + 1);
}

ContentReader::ContentReader(const ElementNode* element) : parent_(element) {
  MoveTo(element->FirstChild());
}

bool ContentReader::IsAt(std::string_view localName) const noexcept {
  return current_ != nullptr && current_->LocalName() == localName &&
         current_->NamespaceUri() == kDsNamespace;
}

const ElementNode* ContentReader::TakeAny() {
  if (current_ == nullptr) {
    Refuse(parent_, "lacks an element");
  }
  const ElementNode* taken = current_;
  MoveTo(taken->NextSibling());
  return taken;
}

const ElementNode* ContentReader::Take(std::string_view localName) {
  if (IsAt(localName)) {
    return TakeAny();
  }
  const std::string expected = "where " + Quote(localName) + " of XML-Signature is expected";
  if (current_ == nullptr) {
    Refuse(parent_, "ends " + expected);
  }
  Refuse(parent_, "holds " + Quote(current_->QualifiedNameText()) + " " + expected);
}

const ElementNode* ContentReader::TakeIf(std::string_view localName) {
  return IsAt(localName) ? TakeAny() : nullptr;
}

void ContentReader::ExpectEnd() const {
  if (current_ != nullptr) {
    Refuse(parent_, "holds the unexpected element " + Quote(current_->QualifiedNameText()));
  }
}

void ContentReader::MoveTo(const Node* node) {
  current_ = nullptr;
  for (; node != nullptr; node = node->NextSibling()) {
    switch (node->Kind()) {
      case NodeKind::kElement:
        current_ = static_cast<const ElementNode*>(node);
        return;
      case NodeKind::kComment:
        break;
      case NodeKind::kText:
        if (!IsWhiteSpace(static_cast<const TextNode*>(node)->Text())) {
          Refuse(parent_, "holds text between its elements");
        }
        break;
      default:
        Refuse(parent_, "holds a processing instruction");
    }
  }
}

void ExpectAttributes(const ElementNode* element, std::initializer_list<std::string_view> names) {
  for (std::size_t i = 0; i < element->AttributeCount(); ++i) {
    const Attribute& attribute = element->AttributeAt(i);
    if (!attribute.IsNamespaceDeclaration() &&
        std::find(names.begin(), names.end(), attribute.Name()) == names.end()) {
      Refuse(element, "has the unexpected attribute " + Quote(attribute.Name()));
    }
  }
}

std::string AlgorithmOf(const ElementNode* element) {
  ExpectAttributes(element, {"Algorithm"});
  const auto algorithm = element->FindAttribute("Algorithm");
  if (!algorithm) {
    Refuse(element, "lacks the attribute 'Algorithm'");
  }
  return std::string(*algorithm);
}

std::string TextOf(const ElementNode* element) {
  std::string text;
  for (const Node* node = element->FirstChild(); node != nullptr; node = node->NextSibling()) {
    if (node->Kind() != NodeKind::kText) {
      Refuse(element, "may hold nothing but text");
    }
    const auto* part = static_cast<const TextNode*>(node);
    // Other XML readers give a CDATA section a separate node, and may use only the first node.
    if (part->HasCDataSection()) {
      Refuse(element, "may not hold a CDATA section");
    }
    text.append(part->Text());
  }
  return std::string(Trim(text));
}

std::vector<unsigned char> BytesOf(const ElementNode* element) {
  std::vector<unsigned char> bytes;
  try {
    StringUtil::Base64Decode(TextOf(element), bytes);
  } catch (const Base64FormatException&) {
    Refuse(element, "does not hold Base64");
  }
  if (bytes.empty()) {
    Refuse(element, "is empty");
  }
  return bytes;
}

}  // namespace Tarnik::Xml::Security
