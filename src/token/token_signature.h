#ifndef SSOCLIENT_TOKEN_TOKEN_SIGNATURE_H
#define SSOCLIENT_TOKEN_TOKEN_SIGNATURE_H

#include <string_view>

#include <tarnik/core/ref.h>
#include <tarnik/xml/security/key_info_resolver.h>
#include <tarnik/xml/security/signature.h>

#include "token/child_cursor.h"

namespace SsoClient {

/// Reads the signature at the cursor. Checks its form, that one of its references is to the
/// assertion with this ID or to the whole document, and that its KeyInfo, which is not signed,
/// contains no SAML element. Does not verify the signature. Throws `ParseException`.
Tarnik::Ref<Tarnik::Xml::Security::Signature> ReadSignature(ChildCursor& cursor,
                                                            std::string_view assertionId);

/// Throws `InvalidSignatureException` unless `signature` and all its references verify with the key
/// that `resolver` returns.
void VerifySignature(const Tarnik::Xml::Security::Signature& signature,
                     const Tarnik::Xml::Security::KeyInfoResolver* resolver);

}  // namespace SsoClient

#endif
