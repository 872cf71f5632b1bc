#ifndef SSOCLIENT_STS_SOAP_FAULT_H
#define SSOCLIENT_STS_SOAP_FAULT_H

#include <tarnik/xml/element_node.h>

namespace SsoClient {

/// Returns when the envelope's body contains no fault (SOAP 1.1, section 4.4). Otherwise throws
/// `PasswordExpiredException` or `InvalidCredentialsException` for the fault codes with that
/// meaning (WS-Trust 1.3, section 11; Web Services Security: SOAP Message Security 1.0, section
/// 12), `SsoException` for any other code, and `ParseException` for a code with an undeclared
/// prefix. The fault string of a refused timestamp, which is not in the exception's message, is
/// logged as a warning.
void CheckSoapFault(const Tarnik::Xml::ElementNode& envelope);

}  // namespace SsoClient

#endif
