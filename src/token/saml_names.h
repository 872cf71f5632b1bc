#ifndef SSOCLIENT_TOKEN_SAML_NAMES_H
#define SSOCLIENT_TOKEN_SAML_NAMES_H

#include <string_view>

namespace SsoClient {

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
