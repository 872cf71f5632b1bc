#ifndef SSOCLIENT_TOKEN_STRICT_RULES_H
#define SSOCLIENT_TOKEN_STRICT_RULES_H

#include <cstdint>
#include <initializer_list>
#include <optional>
#include <string_view>

#include <tarnik/system/date_time.h>
#include <tarnik/xml/element_node.h>

#include "support/namespaces.h"
#include "support/qname.h"
#include "token/child_cursor.h"

namespace SsoClient {

/// `node` as an element; null when it is null or of another kind.
Tarnik::Xml::ElementNode* AsElement(Tarnik::Xml::Node* node) noexcept;

/// `node` as the element of this name and namespace. Throws `ParseException` when it is anything
/// else or null.
Tarnik::Xml::ElementNode& ExpectElement(Tarnik::Xml::Node* node, std::string_view localName,
                                        std::string_view namespaceUri);

/// Throws `ParseException` unless the cursor's element has nothing more to read.
void ExpectEmpty(const ChildCursor& cursor);

/// The text of an element whose only child is text; as long-lived as the tree. Throws
/// `ParseException` for any other content: a comment that splits a value would otherwise let two
/// readers of one signed text see two values.
std::string_view ReadTextContent(const Tarnik::Xml::ElementNode& element);

/// The expanded name of xsi:type; elements may bind its namespace to any prefix.
inline constexpr QNameView kTypeAttribute = {kXsiNamespace, "type"};

/// Throws `ParseException` unless `element` has all `required` attributes and, namespace
/// declarations aside, none but these and `optional` ones. Names are qualified names.
void CheckAttributes(const Tarnik::Xml::ElementNode& element,
                     std::initializer_list<std::string_view> required,
                     std::initializer_list<std::string_view> optional = {});

/// The same rule by expanded names, for elements that may carry xsi:type; names the attribute that
/// is one too many.
void CheckEachAttribute(const Tarnik::Xml::ElementNode& element,
                        std::initializer_list<QNameView> required,
                        std::initializer_list<QNameView> optional = {});

/// The value of xsi:type, or none.
std::optional<std::string_view> FindTypeAttribute(const Tarnik::Xml::ElementNode& element);

/// For elements that are read the same way whatever type they name: throws `ParseException` when
/// xsi:type is there with a prefix that nothing binds, since a type that cannot be named is none.
void CheckTypeIsNameable(const Tarnik::Xml::ElementNode& element);

/// The readers below take the attribute of this qualified name and throw `ParseException` when it
/// is missing or its value is not of the kind that they read.
std::string_view ReadAttribute(const Tarnik::Xml::ElementNode& element, std::string_view name);
Tarnik::System::DateTime ReadDateAttribute(const Tarnik::Xml::ElementNode& element,
                                           std::string_view name);
/// Decimal digits behind an optional sign, at most 2^32 - 1.
std::uint32_t ReadCountAttribute(const Tarnik::Xml::ElementNode& element, std::string_view name);
/// "true", "false", "1" or "0", in any letter case.
bool ReadBooleanAttribute(const Tarnik::Xml::ElementNode& element, std::string_view name);

}  // namespace SsoClient

#endif
