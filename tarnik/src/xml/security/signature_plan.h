#ifndef TARNIK_XML_SECURITY_SIGNATURE_PLAN_H
#define TARNIK_XML_SECURITY_SIGNATURE_PLAN_H

#include <vector>

#include <tarnik/xml/node.h>

#include "xml/security/algorithms.h"
#include "xml/security/digest_writer.h"
#include "xml/security/signature_reader.h"

namespace Tarnik::Xml::Security {

/// The part of a document that a digest is computed over.
struct DigestInput {
  const Node* apex = nullptr;
  const ElementNode* omitted = nullptr;  // null for nothing
  C14nOptions canonicalization;
  Crypto::Hash hash = Crypto::Hash::kSha256;
};

/// Everything that must be computed to verify or create a signature. Made before anything is
/// computed, so that no transform runs for a signature with an unsupported algorithm or reference.
struct SignaturePlan {
  Crypto::SignatureScheme scheme = Crypto::SignatureScheme::kRsaPkcs1;
  DigestInput signedInfo;
  std::vector<DigestInput> references;
};

/// Validates all algorithms and references; the latter are looked up in the tree of `root`. Throws
/// `XmlSecurityException`.
SignaturePlan PlanSignature(const Node* root, const ElementNode* signature,
                            const SignatureContent& content);

/// Computes the digest of the canonical form. Throws `XmlSecurityException`, and `CryptoException`
/// when OpenSSL fails.
Digest ComputeDigest(const DigestInput& input, DigestWriter& writer);

}  // namespace Tarnik::Xml::Security

#endif
