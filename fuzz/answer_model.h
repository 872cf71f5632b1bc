#ifndef FUZZ_ANSWER_MODEL_H
#define FUZZ_ANSWER_MODEL_H

#include <optional>
#include <string>
#include <vector>

#include <libxml/tree.h>

namespace Fuzz {

/// What an answer of a security token service says, read from libxml2's tree and apart from the
/// library. Elements are found by their local names, always the first of a name.

enum class ModelFault {
  kNone,
  kCredentials,
  kPasswordExpired,
  kOther,
};

struct ModelNegotiation {
  std::string contextId;
  std::vector<unsigned char> leg;
  bool hasToken = false;
};

ModelFault FaultOf(const xmlNode* envelope);
/// True if an answer to Issue, or to Renew, has an assertion.
bool HasIssuedToken(const xmlNode* envelope);
bool HasRenewedToken(const xmlNode* envelope);
/// The verdict in an answer to Validate; none if there is no such verdict.
std::optional<bool> VerdictOf(const xmlNode* envelope);
/// A leg of a negotiation; none if the answer is not one.
std::optional<ModelNegotiation> NegotiationOf(const xmlNode* envelope);

}  // namespace Fuzz

#endif
