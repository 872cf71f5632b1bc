#include "operations/operations.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <utility>

#include <openssl/rand.h>

#include "signing/openssl_handles.h"
#include "soap/fault.h"

namespace DevSts {

std::string MakeId() {
  std::array<unsigned char, 16> octets{};
  if (RAND_bytes(octets.data(), octets.size()) != 1) {
    ThrowOpenSslError("random ID");
  }
  std::string id = "_";
  for (const unsigned char octet : octets) {
    std::array<char, 3> hex{};
    std::snprintf(hex.data(), hex.size(), "%02x", octet);
    id += hex.data();
  }
  return id;
}

std::string IssueAndRemember(TokenContent content, const CheckedRequest& request,
                             ServiceParts& parts, TokenAnswer kind, const ServerLeg& leg) {
  IssuedAnswer answer = IssueToken(content, request.shape, parts.identity, kind, leg);
  parts.tokens.Remember(answer.assertionId, std::move(content));
  return std::move(answer.envelope);
}

Time GrantedEnd(Time from, std::chrono::milliseconds asked, const AssertionOptions& shape) {
  const auto longest = std::chrono::duration_cast<std::chrono::milliseconds>(shape.maxLifetime);
  return from + std::min(asked, longest);
}

void RequireSensibleLifetime(Time created, Time expires, Time earliestEnd) {
  if (expires <= created) {
    ThrowInvalidTimeRange("The Lifetime is not positive");
  }
  if (expires <= earliestEnd) {
    ThrowInvalidTimeRange("The Lifetime has ended");
  }
}

}  // namespace DevSts
