#ifndef TARNIK_XML_SECURITY_SIGNATURE_PLAN_H
#define TARNIK_XML_SECURITY_SIGNATURE_PLAN_H

#include <tarnik/xml/node.h>
#include <vector>

#include "xml/security/algorithm_list.h"
#include "xml/security/digest_writer.h"
#include "xml/security/signature_reader.h"

namespace Tarnik::Xml::Security {

/// What of a document a digest is computed over.
struct DigestInput {
  const Node* apex = nullptr;
  const ElementNode* omitted = nullptr;  // or null
  C14nOptions canonicalization;
  Crypto::Hash hash = Crypto::Hash::kSha256;
};

/// All that is to be computed to verify or make a signature. Made before anything is computed, so
/// that a signature with one thing off the list does not get a single transform run.
struct SignaturePlan {
  Crypto::SignatureScheme scheme = Crypto::SignatureScheme::kRsaPkcs1;
  DigestInput signedInfo;
  std::vector<DigestInput> references;
};

/// Judges every algorithm and reference; these are looked up in everything below `root`. Throws
/// `XmlSecurityException`.
SignaturePlan PlanSignature(const Node* root, const ElementNode* signature,
                            const SignatureContent& content);

/// Canonicalises into the digest. Throws `XmlSecurityException`, and `CryptoException` when OpenSSL
/// fails.
Digest ComputeDigest(const DigestInput& input, DigestWriter& writer);

}  // namespace Tarnik::Xml::Security

#endif
