#ifndef FUZZ_TOKEN_COMPARISON_H
#define FUZZ_TOKEN_COMPARISON_H

#include <optional>
#include <string>

#include <ssoclient/saml_token.h>
#include <tarnik/xml/document.h>

#include "token_model.h"

namespace Fuzz {

/// The token that the model reads in a text that the parser accepts. Crashes the process if libxml2
/// refuses the text.
///
/// The one thing that the library itself decides here is what the ds:KeyInfo of the signature may
/// hold: tokens do not depend on it until they are verified, and many kinds of content are skipped.
std::optional<ModelToken> ReadByModel(const std::string& text,
                                      const Tarnik::Xml::Document& document);

/// Crashes the process unless the token has exactly the values of the model's.
void RequireValues(const SsoClient::SamlToken& token, const ModelToken& model);

}  // namespace Fuzz

#endif
