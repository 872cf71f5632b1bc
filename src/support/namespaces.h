#ifndef SSOCLIENT_SUPPORT_NAMESPACES_H
#define SSOCLIENT_SUPPORT_NAMESPACES_H

// The namespace URIs of requests, answers and tokens. Those of WS-Trust are in
// xml/ws_trust_names.h, since they change with its version; those of a vendor are in deployment.h,
// since they are build settings.
namespace SsoClient {

/// SOAP 1.1, section 4.
inline constexpr char kSoapNamespace[] = "http://schemas.xmlsoap.org/soap/envelope/";

/// WS-Addressing 1.0.
inline constexpr char kWsaNamespace[] = "http://www.w3.org/2005/08/addressing";

/// Web Services Security: SOAP Message Security 1.0.
inline constexpr char kWsseNamespace[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
inline constexpr char kWsuNamespace[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd";

/// The namespace of wsse11:TokenType. The standard has another one (Web Services Security: SOAP
/// Message Security 1.1, section 2.2); services expect this one.
inline constexpr char kWsse11Namespace[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.1.xsd";

/// SAML 2.0 assertions (SAML 2.0 core, section 2.1).
inline constexpr char kSamlNamespace[] = "urn:oasis:names:tc:SAML:2.0:assertion";

/// The delegation restriction (SAML 2.0 Condition for Delegation Restriction, section 2).
inline constexpr char kDelegationNamespace[] = "urn:oasis:names:tc:SAML:2.0:conditions:delegation";

/// XML signatures (XML Signature 1.1, section 1.3).
inline constexpr char kDsigNamespace[] = "http://www.w3.org/2000/09/xmldsig#";

/// The built-in types of XML Schema (XML Schema Part 2, section 3.1).
inline constexpr char kXsNamespace[] = "http://www.w3.org/2001/XMLSchema";

/// xsi:type (XML Schema Part 1, section 2.6).
inline constexpr char kXsiNamespace[] = "http://www.w3.org/2001/XMLSchema-instance";

}  // namespace SsoClient

#endif
