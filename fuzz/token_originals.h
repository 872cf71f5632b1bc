#ifndef FUZZ_TOKEN_ORIGINALS_H
#define FUZZ_TOKEN_ORIGINALS_H

#include <cstddef>
#include <string>
#include <vector>

#include <devsts/certificates.h>
#include <devsts/xml_security.h>
#include <tarnik/core/ref.h>
#include <tarnik/xml/security/key_info_resolver.h>

namespace Fuzz {

/// One who signs tokens, and a resolver that trusts only this signer.
struct Signer {
  DevSts::Credential credential;
  DevSts::SignatureAlgorithm algorithm;
  Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> resolver;
};

/// Signers with RSA, RSA-PSS and EC keys; made at the first call.
const std::vector<Signer>& Signers();

/// Unsigned assertions, valid for an hour from the first call: with all that a bearer token can
/// have, with nothing that is optional, renewable, delegable, delegated, and for a holder of a key.
const std::vector<std::string>& Layouts();

/// An edit that makes an assertion one that has to be refused, whoever signs it.
struct Flaw {
  const char* from;
  const char* to;
};
const std::vector<Flaw>& Flaws();

/// `text` with the first occurrence of the flaw's place replaced, if it has one.
std::string WithFlaw(std::string text, const Flaw& flaw);

}  // namespace Fuzz

#endif
