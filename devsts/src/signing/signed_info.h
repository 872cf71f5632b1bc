#ifndef DEVSTS_SIGNING_SIGNED_INFO_H
#define DEVSTS_SIGNING_SIGNED_INFO_H

#include <string>
#include <string_view>

#include <libxml/tree.h>

namespace DevSts {

// The only child element of this name in the signature namespace. Throws XmlError.
xmlNode* SignatureChild(const xmlNode* parent, const char* localName);

// The URI in SignedInfo's SignatureMethod.
std::string SignatureMethodOf(const xmlNode* signature);
void SetSignatureMethod(xmlNode* signature, const char* uri);

// SignedInfo in the canonical form that its CanonicalizationMethod names.
std::string CanonicalSignedInfo(xmlNode* signature);

// xmlsec1 1.2 does not support RSA-PSS: these two compute and verify the signature value with
// OpenSSL (RFC 8017, section 8.1; the salt is as long as the digest: RFC 6931, section 2.3.10).
void WritePssSignatureValue(xmlNode* signature, std::string_view keyPem);
bool PssSignatureValueIsRight(xmlNode* signature, std::string_view certificatePem);

}  // namespace DevSts

#endif
