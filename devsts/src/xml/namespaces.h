#ifndef DEVSTS_XML_NAMESPACES_H
#define DEVSTS_XML_NAMESPACES_H

namespace DevSts {

inline constexpr char kSoapNamespace[] = "http://schemas.xmlsoap.org/soap/envelope/";
inline constexpr char kTrustNamespace[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512";
inline constexpr char kTrust14Namespace[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200802";
inline constexpr char kWsseNamespace[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
inline constexpr char kWsuNamespace[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd";
inline constexpr char kWsse11Namespace[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.1.xsd";
inline constexpr char kAddressingNamespace[] = "http://www.w3.org/2005/08/addressing";
inline constexpr char kSamlNamespace[] = "urn:oasis:names:tc:SAML:2.0:assertion";
inline constexpr char kDelegationNamespace[] = "urn:oasis:names:tc:SAML:2.0:conditions:delegation";
inline constexpr char kDsigNamespace[] = "http://www.w3.org/2000/09/xmldsig#";
inline constexpr char kSchemaNamespace[] = "http://www.w3.org/2001/XMLSchema";
inline constexpr char kSchemaInstanceNamespace[] = "http://www.w3.org/2001/XMLSchema-instance";

}  // namespace DevSts

#endif
