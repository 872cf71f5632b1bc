#include <utility>

#include <ssoclient/access/verdict.h>
#include <tarnik/core/exception.h>

#include "gate/ledger_texts.h"
#include "gate/verdict_facts.h"
#include "secret_text.h"

namespace SsoClient::Access {

namespace {

constexpr int kCheckCount = static_cast<int>(CheckKind::kPredicate) + 1;

CheckOutcome OutcomeOf(const VerdictFacts& facts, CheckKind check) noexcept {
  if (facts.reason == Reason::kNone) {
    return CheckOutcome::kPassed;
  }
  if (facts.Config() == nullptr || check > facts.failed) {
    return CheckOutcome::kNotReached;
  }
  return check == facts.failed ? CheckOutcome::kFailed : CheckOutcome::kPassed;
}

CheckRecord RecordOf(const VerdictFacts& facts, CheckKind check) {
  CheckRecord record;
  record.check = check;
  record.outcome = OutcomeOf(facts, check);
  if (record.outcome != CheckOutcome::kNotReached && facts.Config() != nullptr) {
    record.compared = ComparedText(facts, check);
  }
  return record;
}

std::string DecisionText(const VerdictFacts& facts) {
  const GateConfig* const config = facts.Config();
  std::string text =
      config == nullptr || config->name.empty() ? "" : ToRecordText(config->name) + ": ";
  if (facts.reason == Reason::kNone) {
    return text.append("accepted\n");
  }
  return text.append("refused (")
      .append(NameOf(facts.reason))
      .append("): ")
      .append(facts.message)
      .append("\n");
}

}  // namespace

Verdict::Verdict(std::shared_ptr<const VerdictFacts> facts) noexcept : facts_(std::move(facts)) {}

bool Verdict::IsAccepted() const noexcept {
  return facts_->reason == Reason::kNone;
}

const std::shared_ptr<const SamlToken>& Verdict::Token() const noexcept {
  static const std::shared_ptr<const SamlToken> none;
  return IsAccepted() ? facts_->checked->token : none;
}

Reason Verdict::Refusal() const noexcept {
  return facts_->reason;
}

const std::string& Verdict::Message() const noexcept {
  return facts_->message;
}

std::vector<CheckRecord> Verdict::Ledger() const {
  std::vector<CheckRecord> ledger;
  ledger.reserve(kCheckCount);
  for (int check = 0; check < kCheckCount; ++check) {
    ledger.push_back(RecordOf(*facts_, static_cast<CheckKind>(check)));
  }
  return ledger;
}

std::string Verdict::ToString() const {
  std::string text = DecisionText(*facts_);
  for (const CheckRecord& record : Ledger()) {
    text.append("  ").append(NameOf(record.check)).append(": ").append(NameOf(record.outcome));
    if (!record.compared.empty()) {
      text.append(": ").append(record.compared);
    }
    text.push_back('\n');
  }
  return text;
}

Verdict Verdict::Accept(std::shared_ptr<const SamlToken> token) {
  if (token == nullptr) {
    throw Tarnik::InvalidArgumentException("The accepted token is null.");
  }
  auto checked = std::make_shared<CheckedToken>();
  checked->token = std::move(token);
  auto facts = std::make_shared<VerdictFacts>();
  facts->checked = std::move(checked);
  return Verdict(std::move(facts));
}

Verdict Verdict::Refuse(Reason reason, const std::string& message) {
  if (reason == Reason::kNone) {
    throw Tarnik::InvalidArgumentException("A refusal needs a reason.");
  }
  auto facts = std::make_shared<VerdictFacts>();
  facts->reason = reason;
  facts->message = ToRecordText(message);
  return Verdict(std::move(facts));
}

}  // namespace SsoClient::Access
