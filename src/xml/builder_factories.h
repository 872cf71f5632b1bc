#ifndef SSOCLIENT_XML_BUILDER_FACTORIES_H
#define SSOCLIENT_XML_BUILDER_FACTORIES_H

#include <memory>
#include <string_view>

#include <ssoclient/saml_token.h>

#include "xml/attribute_map.h"
#include "xml/xml_base_builder.h"
#include "xml/xml_composite_builder.h"

namespace SsoClient {

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
