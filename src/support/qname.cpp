#include "support/qname.h"

#include <optional>

#include <ssoclient/exceptions.h>

#include "support/concat.h"

namespace SsoClient {

namespace {

// A QName contains no white space, so collapsing it (XML Schema Part 2, section 4.3.6) only removes
// what is around it.
std::string_view Collapsed(std::string_view name) {
  constexpr std::string_view kWhiteSpace = "\t\n\r ";
  const std::size_t first = name.find_first_not_of(kWhiteSpace);
  if (first == std::string_view::npos) {
    return {};
  }
  return name.substr(first, name.find_last_not_of(kWhiteSpace) - first + 1);
}

}  // namespace

QNameView ResolveQNameView(const Tarnik::Xml::ElementNode& context, std::string_view name,
                           std::string_view defaultNamespace) {
  const std::size_t colon = name.find(':');
  if (colon == std::string_view::npos) {
    return {defaultNamespace, name};
  }
  const std::string_view prefix = name.substr(0, colon);
  const std::optional<std::string_view> namespaceUri = context.LookupNamespace(prefix);
  if (!namespaceUri) {
    throw ParseException(
        Concat({"Element ", context.QualifiedNameText(), "at ", std::to_string(context.Line()), ",",
                std::to_string(context.Column()), " uses undefined prefix: `", prefix, "'"}));
  }
  return {*namespaceUri, name.substr(colon + 1)};
}

QName ResolveQName(const Tarnik::Xml::ElementNode& context, std::string_view name,
                   std::string_view defaultNamespace) {
  const QNameView view = ResolveQNameView(context, Collapsed(name), defaultNamespace);
  return {std::string(view.namespaceUri), std::string(view.localName)};
}

QNameView ResolveQNameValue(const Tarnik::Xml::ElementNode& context, std::string_view value) {
  const std::string_view name = Collapsed(value);
  // Only a name without a prefix needs the default namespace: looking it up walks to the root.
  const bool isPrefixed = name.find(':') != std::string_view::npos;
  return ResolveQNameView(context, name,
                          isPrefixed ? "" : context.LookupNamespace("").value_or(""));
}

}  // namespace SsoClient
