#include "token/strict_rules.h"

#include <algorithm>

#include <boost/lexical_cast.hpp>
#include <boost/numeric/conversion/cast.hpp>

#include <ssoclient/exceptions.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/character_nodes.h>

#include "support/concat.h"

namespace SsoClient {

namespace {

using Tarnik::Xml::Attribute;
using Tarnik::Xml::ElementNode;

[[noreturn]] void FailMissing(const ElementNode& element, std::string_view attribute) {
  throw ParseException(Concat(
      {"Node '", element.QualifiedNameText(), " is missing required attribute '", attribute, "'"}));
}

template <class Name>
bool Contains(std::initializer_list<Name> names, const Name& name) {
  return std::find(names.begin(), names.end(), name) != names.end();
}

std::string_view DisplayName(const QNameView& name) {
  return name == kTypeAttribute ? std::string_view("xsi:type") : name.localName;
}

// In a locale with digit grouping, lexical_cast would also accept "1,000".
bool IsPlainInteger(std::string_view text) {
  if (!text.empty() && (text.front() == '+' || text.front() == '-')) {
    text.remove_prefix(1);
  }
  return !text.empty() && text.find_first_not_of("0123456789") == std::string_view::npos;
}

}  // namespace

void CheckAttributes(const ElementNode& element, std::initializer_list<std::string_view> required,
                     std::initializer_list<std::string_view> optional) {
  for (const std::string_view name : required) {
    if (!element.FindAttribute(name)) {
      FailMissing(element, name);
    }
  }
  for (std::size_t i = 0; i < element.AttributeCount(); ++i) {
    const Attribute& attribute = element.AttributeAt(i);
    if (!attribute.IsNamespaceDeclaration() && !Contains(required, attribute.Name()) &&
        !Contains(optional, attribute.Name())) {
      throw ParseException(
          Concat({"Unexpected attributes on element '", element.QualifiedNameText(), "'"}));
    }
  }
}

void CheckEachAttribute(const ElementNode& element, std::initializer_list<QNameView> required,
                        std::initializer_list<QNameView> optional) {
  for (const QNameView& name : required) {
    if (!element.FindAttribute(name.namespaceUri, name.localName)) {
      FailMissing(element, DisplayName(name));
    }
  }
  for (std::size_t i = 0; i < element.AttributeCount(); ++i) {
    const Attribute& attribute = element.AttributeAt(i);
    if (attribute.IsNamespaceDeclaration()) {
      continue;
    }
    // An attribute without a prefix is in no namespace (Namespaces in XML 1.0, section 6.2).
    const QNameView name = ResolveQNameView(element, attribute.Name(), "");
    if (!Contains(required, name) && !Contains(optional, name)) {
      throw ParseException(Concat({"Unexpected attribute '", attribute.Name(), "' on element '",
                                   element.QualifiedNameText(), "'"}));
    }
  }
}

std::optional<std::string_view> FindTypeAttribute(const ElementNode& element) {
  return element.FindAttribute(kTypeAttribute.namespaceUri, kTypeAttribute.localName);
}

std::string_view ReadAttribute(const ElementNode& element, std::string_view name) {
  const std::optional<std::string_view> value = element.FindAttribute(name);
  if (!value) {
    FailMissing(element, name);
  }
  return *value;
}

Tarnik::System::DateTime ReadDateAttribute(const ElementNode& element, std::string_view name) {
  const std::string_view text = ReadAttribute(element, name);
  try {
    return Tarnik::System::DateTime::Parse(text);
  } catch (const Tarnik::DateTimeFormatException&) {
    throw ParseException(Concat({element.QualifiedNameText(), "/@", name, " is not a date"}));
  }
}

std::uint32_t ReadCountAttribute(const ElementNode& element, std::string_view name) {
  const std::string_view text = ReadAttribute(element, name);
  try {
    if (IsPlainInteger(text)) {
      return boost::numeric_cast<std::uint32_t>(
          boost::lexical_cast<long>(text.data(), text.size()));
    }
  } catch (const boost::bad_lexical_cast&) {
    // Too many digits for 64 bits.
  } catch (const boost::numeric::bad_numeric_cast&) {
    // Negative, or too large for a count.
  }
  throw ParseException(
      Concat({element.QualifiedNameText(), "/@", name, " is not a non-negative integer."}));
}

bool ReadBooleanAttribute(const ElementNode& element, std::string_view name) {
  const std::string text = Tarnik::StringUtil::ToLower(ReadAttribute(element, name));
  if (text == "true" || text == "1") {
    return true;
  }
  if (text == "false" || text == "0") {
    return false;
  }
  throw ParseException(Concat({element.QualifiedNameText(), "/@", name, " is not a Boolean"}));
}

std::string_view ReadTextContent(const ElementNode& element) {
  const Tarnik::Xml::Node* child = element.FirstChild();
  if (child == nullptr || child->Kind() != Tarnik::Xml::NodeKind::kText ||
      child->NextSibling() != nullptr) {
    throw ParseException(
        Concat({"Element '", element.QualifiedNameText(),
                "' must only have textual content (but has extra children or is empty)."}));
  }
  return static_cast<const Tarnik::Xml::TextNode*>(child)->Text();
}

void ExpectEmpty(const ChildCursor& cursor) {
  if (!cursor.IsAtEnd()) {
    throw ParseException(
        Concat({"Element '", cursor.Parent().QualifiedNameText(), "' must be empty"}));
  }
}

}  // namespace SsoClient
