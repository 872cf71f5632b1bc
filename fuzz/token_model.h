#ifndef FUZZ_TOKEN_MODEL_H
#define FUZZ_TOKEN_MODEL_H

#include <functional>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include <libxml/tree.h>

namespace Fuzz {

/// What a token says, read from libxml2's tree and apart from the library. Times are microseconds
/// since 1970.
struct ModelPrincipal {
  std::string name;
  std::string domain;

  bool operator==(const ModelPrincipal&) const = default;
};

struct ModelDelegate {
  ModelPrincipal principal;
  long instant = 0;
};

struct ModelAttribute {
  std::string name;
  std::vector<std::string> values;
};

struct ModelAdvice {
  std::string source;
  std::vector<ModelAttribute> attributes;
};

struct ModelToken {
  std::string version;
  std::string id;
  std::string issuer;
  ModelPrincipal subject;
  bool isHolderOfKey = false;
  std::optional<ModelPrincipal> confirmedDelegate;
  long confirmedUntil = 0;
  std::vector<unsigned char> certificate;
  long notBefore = 0;
  long notOnOrAfter = 0;
  std::set<std::string> audiences;
  unsigned long renewals = 0;
  unsigned long proxies = 0;
  std::optional<std::vector<ModelDelegate>> delegates;
  std::vector<ModelAdvice> advice;
  bool isSolution = false;
  std::string givenName;
  std::string surname;
  std::vector<ModelPrincipal> groups;
};

/// The token in an element, or nothing if the element is not a token: it has another layout, or
/// breaks a rule that does not depend on the time. `isSignature` decides whether an element is a
/// ds:Signature.
std::optional<ModelToken> ReadToken(const xmlNode* assertion,
                                    const std::function<bool(const xmlNode*)>& isSignature);

/// True if the token is in its validity period at `now`, widened by a tolerance in microseconds.
bool IsCurrent(const ModelToken& token, long now, long tolerance);

}  // namespace Fuzz

#endif
