// The input makes a gate, the trust that it has, a signed token that may be edited, and a few
// presentations of that text, between which the time and the trust may change. Each verdict is the
// same whether the token is remembered or not:
//  - An accepted token has passed every check; of a refused one, one check has failed, all before
//    it have passed, and none after it was reached.
//  - The reason is the one of the model for a token that nobody has edited. An edited one is
//    accepted only if the core accepts the text with the same certificates at the same time, and
//    with the values that were signed; it is refused for its signature or its form only if the core
//    refuses it.
//  - No text of a verdict is longer than a line of the log, or contains the token's signature.
#include <algorithm>
#include <memory>
#include <string>
#include <vector>

#include <fuzzer/FuzzedDataProvider.h>

#include <ssoclient/access/token_gate.h>
#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "fixed_clock.h"
#include "gate/gate_case.h"
#include "gate/gate_model.h"
#include "input.h"
#include "support/token_editor.h"
#include "support/token_values.h"
#include "token_originals.h"
#include "trust/trust_store_impl.h"

namespace {

using SsoClient::Access::CheckKind;
using SsoClient::Access::CheckOutcome;
using SsoClient::Access::Reason;
using SsoClient::Access::Verdict;
using Token = std::shared_ptr<const SsoClient::SamlToken>;

constexpr std::size_t kChecks = 15;
constexpr std::size_t kLongestText = 1000;
constexpr long kHour = 3600;

/// A trust store whose trust the input sets.
class InputTrust final : public SsoClient::Access::TrustStoreImpl {
 public:
  explicit InputTrust(const Fuzz::TrustCase& trust) { Set(trust); }

  void Set(const Fuzz::TrustCase& trust) {
    current_ = std::make_shared<const SsoClient::Access::TrustSnapshot>(Fuzz::SnapshotOf(trust));
  }
  void Reload() override {}
  SsoClient::Access::TrustDescription Describe() const override { return {}; }
  std::shared_ptr<const SsoClient::Access::TrustSnapshot> Current() const override {
    return current_;
  }
  std::uint64_t Version() const noexcept override { return current_->Version(); }

 private:
  std::shared_ptr<const SsoClient::Access::TrustSnapshot> current_;
};

CheckKind CheckOf(Reason reason) {
  switch (reason) {
    case Reason::kNone:
    case Reason::kTooLarge:
      return CheckKind::kSize;
    case Reason::kNotWellFormed:
      return CheckKind::kWellFormed;
    case Reason::kBadLayout:
      return CheckKind::kLayout;
    case Reason::kNotYetValid:
    case Reason::kExpired:
      return CheckKind::kValidity;
    case Reason::kUnknownIssuer:
    case Reason::kUnknownSigner:
      return CheckKind::kSignerKnown;
    case Reason::kSignerNotYetValid:
    case Reason::kSignerExpired:
      return CheckKind::kSignerValid;
    case Reason::kSignerRevoked:
    case Reason::kRevocationUnknown:
      return CheckKind::kSignerRevoked;
    case Reason::kBadSignature:
      return CheckKind::kSignature;
    case Reason::kWrongAudience:
    case Reason::kUnrestricted:
      return CheckKind::kAudience;
    case Reason::kBearerRefused:
      return CheckKind::kConfirmation;
    case Reason::kNoProof:
    case Reason::kWrongProof:
      return CheckKind::kPossession;
    case Reason::kTooLongLived:
      return CheckKind::kLifetime;
    case Reason::kTooDeeplyDelegated:
      return CheckKind::kDelegation;
    case Reason::kNotInGroup:
      return CheckKind::kGroups;
    case Reason::kRefusedByPredicate:
    case Reason::kPredicateFailed:
      return CheckKind::kPredicate;
  }
  return CheckKind::kSize;
}

bool IsLine(const std::string& text) {
  return text.size() <= kLongestText && std::none_of(text.begin(), text.end(), [](char c) {
           return static_cast<unsigned char>(c) < 0x20 || c == 0x7F;
         });
}

CheckOutcome OutcomeOf(CheckKind check, Reason reason) {
  const CheckKind failed = CheckOf(reason);
  if (reason == Reason::kNone || check < failed) {
    return CheckOutcome::kPassed;
  }
  return check == failed ? CheckOutcome::kFailed : CheckOutcome::kNotReached;
}

void RequireLedger(const Verdict& verdict) {
  const auto ledger = verdict.Ledger();
  Fuzz::Require(ledger.size() == kChecks && IsLine(verdict.Message()));
  for (std::size_t i = 0; i < ledger.size(); ++i) {
    Fuzz::Require(ledger[i].check == static_cast<CheckKind>(i) && IsLine(ledger[i].compared));
    Fuzz::Require(ledger[i].outcome == OutcomeOf(ledger[i].check, verdict.Refusal()));
  }
  const bool isAccepted = verdict.Refusal() == Reason::kNone;
  Fuzz::Require(verdict.IsAccepted() == isAccepted);
  Fuzz::Require((verdict.Token() != nullptr) == isAccepted);
  Fuzz::Require(verdict.Message().empty() == isAccepted);
}

void RequireNoSignature(const Verdict& verdict, const std::string& token) {
  constexpr std::size_t kPiece = 12;
  const std::string begin = "<ds:SignatureValue>";
  const std::size_t start = token.find(begin) + begin.size();
  const std::string value = token.substr(start, token.find('<', start) - start);
  const std::string texts = verdict.ToString();
  for (std::size_t at = 0; at + kPiece <= value.size(); at += kPiece) {
    Fuzz::Require(texts.find(value.substr(at, kPiece)) == std::string::npos);
  }
}

/// What the core says about a text at some time.
enum class CoreVerdict { kAccepted, kNotXml, kNotAToken, kOther };

CoreVerdict AskCore(const std::string& text, const Fuzz::Presented& now, Token& token) {
  std::vector<Tarnik::Ref<const Tarnik::Crypto::Certificate>> certificates;
  const auto snapshot = Fuzz::SnapshotOf(now.trust);
  for (const auto& signer : snapshot.Find("https://sts.example.com/STS")->signers) {
    certificates.push_back(signer.certificate);
  }
  const auto resolver =
      Tarnik::Xml::Security::CreateTrustedCertificatesResolver(std::move(certificates));
  Fuzz::FixClock(Fuzz::AtSecond(now.seconds));
  try {
    token = SsoClient::CreateSamlToken(text, resolver.get(), now.config.clockTolerance.count());
    return CoreVerdict::kAccepted;
  } catch (const Tarnik::Xml::XMLParseException&) {
    return CoreVerdict::kNotXml;
  } catch (const SsoClient::InvalidSignatureException&) {
    return CoreVerdict::kOther;
  } catch (const Tarnik::Exception&) {
    return CoreVerdict::kNotAToken;
  }
}

bool IsOfPolicy(Reason reason) {
  return CheckOf(reason) > CheckKind::kSignature;
}

// The core looks neither at the time nor at the revocation of certificates.
void RequireLikeCore(const Verdict& verdict, const std::string& text, const Fuzz::Presented& now) {
  const Reason reason = verdict.Refusal();
  if (now.trust.empty()) {
    Fuzz::Require(reason == Reason::kNotWellFormed || reason == Reason::kBadLayout ||
                  CheckOf(reason) == CheckKind::kValidity || reason == Reason::kUnknownIssuer);
    return;
  }
  Token token;
  const CoreVerdict core = AskCore(text, now, token);
  Fuzz::Require((reason == Reason::kNotWellFormed) == (core == CoreVerdict::kNotXml));
  Fuzz::Require(reason != Reason::kBadLayout || core == CoreVerdict::kNotAToken);
  if (reason == Reason::kNone || IsOfPolicy(reason)) {
    Fuzz::Require(core == CoreVerdict::kAccepted);
    Fuzz::Require(reason == Fuzz::PolicyReason(now, *token));
  } else if (Fuzz::AreAllUsable(now)) {
    Fuzz::Require(core != CoreVerdict::kAccepted);
  }
}

Token ReadUnchecked(const std::string& text) {
  return SsoClient::CreateSamlToken(text, 1'000'000'000);
}

Reason ExpectedReason(const Fuzz::Presented& now, const Fuzz::GateToken& original,
                      const SsoClient::SamlToken& token) {
  if (const Reason reason = Fuzz::ValidityReason(now, token); reason != Reason::kNone) {
    return reason;
  }
  const Reason reason = Fuzz::SignerReason(now, original);
  return reason != Reason::kNone ? reason : Fuzz::PolicyReason(now, token);
}

std::string Edited(std::string text, FuzzedDataProvider& input) {
  SsoClient::Testing::TokenEditor editor([&input](std::size_t bound) {
    return input.ConsumeIntegralInRange<std::size_t>(0, bound - 1);
  });
  for (int edits = 0; edits < 4 && input.remaining_bytes() > 0; ++edits) {
    editor.Edit(text);
  }
  return text;
}

/// One input.
class Case {
 public:
  explicit Case(FuzzedDataProvider& input)
      : trustCase_(Fuzz::MakeTrustCase(input)),
        trust_(std::make_shared<InputTrust>(trustCase_)),
        original_(Fuzz::MakeGateToken(input)),
        config_(Fuzz::MakeGateConfig(input, predicate_)) {
    config_.trust = trust_;
    config_.clock = [this] { return Fuzz::AtSecond(seconds_); };
  }

  void Run(FuzzedDataProvider& input) {
    const auto gate = SsoClient::Access::CreateTokenGate(config_);
    const Token unchecked = ReadUnchecked(original_.text);
    values_ = SsoClient::Testing::AllValues(*unchecked);
    const int presentations = input.ConsumeIntegralInRange<int>(1, 4);
    std::vector<std::uint32_t> choices;
    for (int i = 0; i < presentations; ++i) {
      choices.push_back(input.ConsumeIntegral<std::uint32_t>());
    }
    const Fuzz::TrustCase other = Fuzz::MakeTrustCase(input);
    const std::string text = Edited(original_.text, input);
    for (const std::uint32_t choice : choices) {
      Choose(choice, other);
      Present(*gate, text, *unchecked);
    }
  }

 private:
  // Mostly a time at which the token is valid.
  void Choose(std::uint32_t choice, const Fuzz::TrustCase& other) {
    sender_ = static_cast<Fuzz::Sender>(choice % Fuzz::kSenders);
    const long offset = static_cast<long>(choice >> 8U & 0xFFFU) * 4;
    seconds_ = (choice & 0xC0U) == 0x40 ? offset - 2 * kHour : offset % 1800;
    if ((choice >> 24U & 3U) == 1) {
      trustCase_ = other;
      trust_->Set(trustCase_);
    }
  }

  void Present(const SsoClient::Access::TokenGate& gate, const std::string& text,
               const SsoClient::SamlToken& unchecked) {
    const Fuzz::Presented now{config_, trustCase_, predicate_, sender_, seconds_};
    const auto before = gate.Metrics();
    const Verdict verdict = gate.Check(text, Fuzz::PresenterOf(sender_));
    RequireLedger(verdict);
    RequireLikeCore(verdict, text, now);
    if (text == original_.text) {
      Fuzz::Require(verdict.Refusal() == ExpectedReason(now, original_, unchecked));
      RequireNoSignature(verdict, text);
    }
    if (verdict.IsAccepted()) {
      Fuzz::Require(SsoClient::Testing::AllValues(*verdict.Token()) == values_);
      Fuzz::Require(verdict.Token()->Xml() == text);
    }
    RequireMetrics(before, gate.Metrics(), verdict.IsAccepted());
  }

  // A refused token is not remembered, and an accepted one is, if there is a cache.
  void RequireMetrics(const SsoClient::Access::GateMetrics& before,
                      const SsoClient::Access::GateMetrics& after, bool isAccepted) const {
    Fuzz::Require(after.cacheHits + after.cacheMisses <= before.cacheHits + before.cacheMisses + 1);
    Fuzz::Require(after.accepted == before.accepted + (isAccepted ? 1 : 0));
    const std::size_t most = std::min<std::size_t>(config_.cache.tokens, 1);
    Fuzz::Require(isAccepted ? after.cachedTokens == most
                             : after.cachedTokens <= before.cachedTokens);
  }

  Fuzz::TrustCase trustCase_;
  std::shared_ptr<InputTrust> trust_;
  Fuzz::GateToken original_;
  Fuzz::PredicateCase predicate_ = Fuzz::PredicateCase::kNone;
  SsoClient::Access::GateConfig config_;
  std::string values_;
  long seconds_ = 0;
  Fuzz::Sender sender_ = Fuzz::Sender::kNobody;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  // The layouts are valid from now on: the clock of the core follows that of the gate.
  Fuzz::Epoch();
  FuzzedDataProvider input(data, size);
  Case made(input);
  made.Run(input);
  return 0;
}
