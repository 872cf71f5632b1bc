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

// Texts to replace, each found once or more; the first place is replaced.
using Edits = std::vector<std::pair<std::string, std::string>>;

// A request that proves a key, before it is signed.
struct ProofRequest {
  std::string tokens;     // behind the Timestamp
  std::string reference;  // what ds:KeyInfo holds
  std::string body;
};

// By a certificate, which stands in the header behind `tokens`.
ProofRequest ByCertificate(const Credential& holder, const std::string& body,
                           const std::string& tokens = "");
// By an assertion, which stands in the header.
ProofRequest ByToken(const std::string& assertion, const std::string& body);

// A ds:Reference as `Sign` writes it, its digest not yet filled in.
std::string ReferenceTo(const std::string& id);

// Signs the Body and the Timestamp with the key, by OpenSSL over libxml2's canonical form. `edits`
// are made before that, so that what they make is signed, too.
std::string Sign(const ProofRequest& request, const Credential& key, const Edits& edits = {});

std::string Edited(std::string text, const Edits& edits);

// An RSA key with a new certificate that it signed itself; the same key for the same name.
Credential Holder(const std::string& commonName = "holder");

// The answer to a request.
std::string Ask(const Server& server, const std::string& envelope,
                const std::string& action = kIssueAction);

// The assertion of a holder-of-key token for alice, acquired by password. Throws if refused.
std::string HolderToken(const Server& server, const Credential& holder,
                        const std::string& more = kUseKey);

// The value of the assertion's ID attribute.
std::string IdOfAssertion(const std::string& assertion);

// The assertion without the ds:Signature that it has.
std::string WithoutSignature(const std::string& assertion);

}  // namespace DevSts::Testing

#endif
