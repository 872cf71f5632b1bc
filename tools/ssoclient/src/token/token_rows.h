#ifndef SSOCLIENT_TOOL_TOKEN_TOKEN_ROWS_H
#define SSOCLIENT_TOOL_TOKEN_TOKEN_ROWS_H

#include <string>

#include <ssoclient/principal_id.h>
#include <ssoclient/saml_token.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>

#include "output/table.h"
#include "token/validity.h"

namespace SsoClient::Tool {

/// "alice@EXAMPLE.COM"; the name only if there is no domain. Not yet safe to write.
std::string PrincipalText(const PrincipalId& principal);

/// The certificate's subject, its SHA-256 and its end in three lines, safe to write.
std::string CertificateText(const Console& console, const Tarnik::Crypto::Certificate& certificate);

/// Adds rows of a label and a value for everything that the token says, and at the end its
/// validity with a bar that shows where in it `now` is: never its text, nor its signature.
void AddTokenRows(const Console& console, const SamlToken& token,
                  const Tarnik::System::DateTime& now, Table& table);

/// The colour for the state: good, bad after the end, and a warning before the start and in the
/// last tenth of the period.
Colour ColourOf(const Validity& validity);

}  // namespace SsoClient::Tool

#endif
