#ifndef SSOCLIENT_TOKEN_TOKEN_SIGNATURE_H
#define SSOCLIENT_TOKEN_TOKEN_SIGNATURE_H

#include <string_view>

#include <tarnik/core/ref.h>
#include <tarnik/xml/security/key_info_resolver.h>
#include <tarnik/xml/security/signature.h>

#include "token/child_cursor.h"

namespace SsoClient {

/// Reads the signature at the cursor and checks its form and that one of its references names the
/// assertion with this ID or the whole document, and that its KeyInfo, which is not signed, holds
/// no SAML element. Verifies nothing. Throws `ParseException`.
Tarnik::Ref<Tarnik::Xml::Security::Signature> ReadSignature(ChildCursor& cursor,
                                                            std::string_view assertionId);

/// Throws `InvalidSignatureException` unless `signature`, all its references included, verifies
/// with the key that `resolver` gives.
void VerifySignature(const Tarnik::Xml::Security::Signature& signature,
                     const Tarnik::Xml::Security::KeyInfoResolver* resolver);

}  // namespace SsoClient

#endif
