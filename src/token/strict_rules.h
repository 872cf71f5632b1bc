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

// The rules for the attributes and the text of an element. A violation causes `ParseException`.
namespace SsoClient {

/// The expanded name of xsi:type; elements may bind its namespace to any prefix.
inline constexpr QNameView kTypeAttribute = {kXsiNamespace, "type"};

/// Throws `ParseException` unless `element` has all `required` attributes and, apart from namespace
/// declarations, no others except `optional` ones. Names are qualified names.
void CheckAttributes(const Tarnik::Xml::ElementNode& element,
                     std::initializer_list<std::string_view> required,
                     std::initializer_list<std::string_view> optional = {});

/// The same rule by expanded names, for elements that may have xsi:type. The message names the
/// unexpected attribute.
void CheckEachAttribute(const Tarnik::Xml::ElementNode& element,
                        std::initializer_list<QNameView> required,
                        std::initializer_list<QNameView> optional = {});

/// The value of xsi:type, if the element has it.
std::optional<std::string_view> FindTypeAttribute(const Tarnik::Xml::ElementNode& element);

// The readers below return the attribute of this qualified name. They throw `ParseException` when
// it is missing or its value is not of the kind that they read.

std::string_view ReadAttribute(const Tarnik::Xml::ElementNode& element, std::string_view name);
Tarnik::System::DateTime ReadDateAttribute(const Tarnik::Xml::ElementNode& element,
                                           std::string_view name);
/// Decimal digits after an optional sign, at most 2^32 - 1.
std::uint32_t ReadCountAttribute(const Tarnik::Xml::ElementNode& element, std::string_view name);
/// "true", "false", "1" or "0", in any letter case.
bool ReadBooleanAttribute(const Tarnik::Xml::ElementNode& element, std::string_view name);

/// Returns the text of an element whose only child is text; valid as long as the tree. Throws
/// `ParseException` for any other content: if a comment could split a value, two readers of one
/// signed text might see two values.
std::string_view ReadTextContent(const Tarnik::Xml::ElementNode& element);

/// Throws `ParseException` unless everything in the cursor's element has been read.
void ExpectEmpty(const ChildCursor& cursor);

}  // namespace SsoClient

#endif
