#ifndef SSOCLIENT_TOKEN_ATTRIBUTE_RULES_H
#define SSOCLIENT_TOKEN_ATTRIBUTE_RULES_H

#include <cstdint>
#include <initializer_list>
#include <optional>
#include <string_view>

#include <tarnik/system/date_time.h>
#include <tarnik/xml/element_node.h>

#include "token/qname.h"
#include "token/saml_names.h"

namespace SsoClient {

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
