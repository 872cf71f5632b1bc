#ifndef DEVSTS_SIGNED_REQUEST_H
#define DEVSTS_SIGNED_REQUEST_H

#include <string>
#include <utility>
#include <vector>

#include "devsts/certificates.h"
#include "devsts/server.h"
#include "request_text.h"

namespace DevSts::Testing {

inline constexpr char kBodyId[] = "Body-1";
inline constexpr char kTimestampId[] = "Timestamp-1";

// Replacements: the first occurrence of each text, which must be present, by the other.
using Edits = std::vector<std::pair<std::string, std::string>>;

// A request that proves possession of a key, before it is signed.
struct ProofRequest {
  std::string tokens;     // after the Timestamp
  std::string reference;  // the content of ds:KeyInfo
  std::string body;
};

// Proves the key by a certificate, which is in the header after `tokens`.
ProofRequest ByCertificate(const Credential& holder, const std::string& body,
                           const std::string& tokens = "");
// Proves the key by an assertion, which is in the header.
ProofRequest ByToken(const std::string& assertion, const std::string& body);

// A ds:Reference as `Sign` writes it, with a placeholder for its digest.
std::string ReferenceTo(const std::string& id);

// Signs the Body and the Timestamp with the key, by OpenSSL over libxml2's canonical form. `edits`
// are applied before that, so that the signature covers them.
std::string Sign(const ProofRequest& request, const Credential& key, const Edits& edits = {});

std::string Edited(std::string text, const Edits& edits);

// A new self-signed certificate with an RSA key. The key is the same for the same name.
Credential Holder(const std::string& commonName = "holder");

// Sends a request and returns the answer.
std::string Ask(const Server& server, const std::string& envelope,
                const std::string& action = kIssueAction);

// The assertion of a holder-of-key token for alice, acquired by password. Throws if the service
// refuses.
std::string HolderToken(const Server& server, const Credential& holder,
                        const std::string& more = kUseKey);

// The value of the assertion's ID attribute.
std::string IdOfAssertion(const std::string& assertion);

// The assertion without its ds:Signature.
std::string WithoutSignature(const std::string& assertion);

}  // namespace DevSts::Testing

#endif
