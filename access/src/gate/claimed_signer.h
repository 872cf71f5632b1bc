#ifndef SSOCLIENT_ACCESS_GATE_CLAIMED_SIGNER_H
#define SSOCLIENT_ACCESS_GATE_CLAIMED_SIGNER_H

#include <string>

#include <tarnik/xml/security/key_info.h>

namespace SsoClient::Access {

/// What `keyInfo` says about the signer, for an operator who may want to trust it: "the certificate
/// 'CN=sts' (SHA-256 AB:CD:...)", with the whole fingerprint. Only the first hint of the kind that
/// selects a signer is described. Its texts are untrusted: they are limited and contain no control
/// characters.
std::string ClaimedSigner(const Tarnik::Xml::Security::KeyInfo& keyInfo);

}  // namespace SsoClient::Access

#endif
