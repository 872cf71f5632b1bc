#ifndef SSOCLIENT_ACCESS_GATE_CONFIRMATION_END_H
#define SSOCLIENT_ACCESS_GATE_CONFIRMATION_END_H

#include <ssoclient/saml_token.h>
#include <tarnik/system/date_time.h>

namespace SsoClient::Access {

/// NotOnOrAfter of the SubjectConfirmationData (SAML 2.0 core, section 2.4.1.2): the first instant
/// at which nobody can be confirmed as the subject any more. It may be before the end of the
/// Conditions. 1970 if it cannot be found, so that the token counts as expired.
Tarnik::System::DateTime ConfirmationEndOf(const SamlToken& token);

}  // namespace SsoClient::Access

#endif
