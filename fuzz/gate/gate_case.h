#ifndef FUZZ_GATE_GATE_CASE_H
#define FUZZ_GATE_GATE_CASE_H

#include <array>
#include <cstddef>
#include <string>
#include <vector>

#include <fuzzer/FuzzedDataProvider.h>

#include <devsts/xml_security.h>
#include <ssoclient/access/token_gate.h>
#include <tarnik/system/date_time.h>

#include "trust/trust_snapshot.h"

namespace Fuzz {

/// The number of `Signers()`. Those from `kFirstRsaSigner` on have one key in several certificates.
constexpr std::size_t kGateSigners = 5;
constexpr std::size_t kFirstRsaSigner = 2;

/// All times of a case are in seconds from this, the first time that it was asked for.
const Tarnik::System::DateTime& Epoch();
Tarnik::System::DateTime AtSecond(long seconds);

/// What is known about a certificate that is trusted.
struct TrustedCase {
  std::size_t signer = 0;
  long notBefore = 0;
  long notAfter = 0;
  long listFrom = 0;
  long listUntil = 0;
  bool isChecked = false;
  bool isRevoked = false;
  bool isCovered = false;
};

/// The certificates that are trusted for the issuer of the layouts, in this order.
using TrustCase = std::vector<TrustedCase>;
TrustCase MakeTrustCase(FuzzedDataProvider& input);
SsoClient::Access::TrustSnapshot SnapshotOf(const TrustCase& trust);

/// Who presents a token.
enum class Sender {
  kNobody,
  kHolderByTls,
  kOtherByTls,
  kHolderBySignature,
  kOtherBySignature,
  kSignerOfOtherData
};
constexpr int kSenders = 6;
SsoClient::Access::Presenter PresenterOf(Sender sender);

/// What the predicate of the gate does.
enum class PredicateCase { kNone, kAccepts, kRefuses, kThrows };

/// A configuration without trust and clock.
SsoClient::Access::GateConfig MakeGateConfig(FuzzedDataProvider& input, PredicateCase& predicate);

/// A signed layout.
struct GateToken {
  std::string text;
  std::size_t signer = 0;
  DevSts::KeyInfoContent keyInfo{};
};
GateToken MakeGateToken(FuzzedDataProvider& input);

}  // namespace Fuzz

#endif
