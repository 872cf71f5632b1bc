#ifndef SSOCLIENT_SUPPORT_NAMESPACES_H
#define SSOCLIENT_SUPPORT_NAMESPACES_H

#include <string_view>

namespace SsoClient {

// The namespaces of requests and answers.

/// WS-Trust 1.3 and the ActAs element of WS-Trust 1.4.
inline constexpr char kWstNamespace[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512";
inline constexpr char kWst14Namespace[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200802";

/// Web Services Security: SOAP Message Security 1.0.
inline constexpr char kWsseNamespace[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
inline constexpr char kWsuNamespace[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd";

/// The namespace of wsse11:TokenType. The standard itself has another one (Web Services Security:
/// SOAP Message Security 1.1, section 2.2); services expect this.
inline constexpr char kWsse11Namespace[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.1.xsd";

/// WS-Addressing 1.0.
inline constexpr char kWsaNamespace[] = "http://www.w3.org/2005/08/addressing";

/// SOAP 1.1, section 4.
inline constexpr char kSoapNamespace[] = "http://schemas.xmlsoap.org/soap/envelope/";

inline constexpr char kXmlSchemaNamespace[] = "http://www.w3.org/2001/XMLSchema";
inline constexpr char kXmlSchemaInstanceNamespace[] = "http://www.w3.org/2001/XMLSchema-instance";

/// How binary tokens are written: in Base64 (Web Services Security: SOAP Message Security 1.0,
/// section 6.3).
inline constexpr char kBase64BinaryEncoding[] =
    "http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-soap-message-security-1.0#Base64Binary";

/// The Id of a request's signature, by which wst:UseKey names it.
inline constexpr char kProofSignatureId[] = "holderOfKeyProofSignature";

/// The wsu:Id of the certificate in a request's header, by which its signature names it.
inline constexpr char kCertificateId[] = "holderOfKeyCertificate";

/// Namespace of SAML 2.0 assertions (SAML 2.0 core, section 2.1).
inline constexpr std::string_view kSamlNamespace = "urn:oasis:names:tc:SAML:2.0:assertion";
/// Namespace of XML signatures (XML-Signature, section 1.3).
inline constexpr std::string_view kDsigNamespace = "http://www.w3.org/2000/09/xmldsig#";
/// Namespace of xsi:type (XML Schema Part 1, section 2.6).
inline constexpr std::string_view kXsiNamespace = "http://www.w3.org/2001/XMLSchema-instance";
/// Namespace of the delegation restriction (SAML 2.0 Condition for Delegation Restriction,
/// section 2).
inline constexpr std::string_view kDelegationNamespace =
    "urn:oasis:names:tc:SAML:2.0:conditions:delegation";

}  // namespace SsoClient

#endif
