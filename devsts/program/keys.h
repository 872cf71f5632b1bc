#ifndef DEVSTS_PROGRAM_KEYS_H
#define DEVSTS_PROGRAM_KEYS_H

#include <chrono>
#include <string>

#include "devsts/certificates.h"

namespace DevSts::Program {

// The keys of a service, each with its certificate.
struct Keys {
  Credential authority;
  Credential server;
  Credential signing;
  Credential client;  // with which a user may log in
};

// How keys are made.
struct KeyPlan {
  std::chrono::seconds validity = kCertificateLifetime;
  KeyType signingKey = KeyType::Rsa2048;
  bool signingByAuthority = false;
};

Keys MakeKeys(const KeyPlan& plan);

// Throws FileError with the name of the file, such as "server.pem", unless the keys load, fit their
// certificates, are valid now, and are issued by the authority as `plan` requires.
void CheckKeys(const Keys& keys, const KeyPlan& plan);

// Whether this authority has issued the certificate.
bool IsIssuedBy(const std::string& certificatePem, const std::string& authorityPem);

// Whether the revocation list names the certificate. Throws std::runtime_error if the list does not
// load or was not signed by the authority.
bool IsRevokedBy(const std::string& listPem, const std::string& certificatePem,
                 const std::string& authorityPem);

}  // namespace DevSts::Program

#endif
