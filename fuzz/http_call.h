#ifndef FUZZ_HTTP_CALL_H
#define FUZZ_HTTP_CALL_H

#include <optional>
#include <string>

#include <tarnik/core/ref.h>
#include <tarnik/http/bounded_user_agent.h>
#include <tarnik/http/http_request.h>
#include <tarnik/http/http_user_agent.h>

#include "http_call_plan.h"
#include "parsed_answer.h"
#include "support/scripted_spec.h"

namespace Fuzz {

void RunAll();

/// With the target of the plan, or "/sts" if that is refused.
Tarnik::Ref<Tarnik::Http::ClientRequest> RequestOf(const HttpCallPlan& plan);

/// One call.
class HttpCall {
 public:
  void Start(Tarnik::Http::UserAgent& agent, const HttpCallPlan& plan, unsigned long limit = 0);

  bool HasEnded() const { return count_ == 1; }
  bool HasFailed() const { return HasEnded() && !result_; }
  bool IsTimeout() const { return HasEnded() && isTimeout_; }
  bool IsCancelled() const { return HasEnded() && isCancelled_; }
  const std::string& Failure() const { return failure_; }
  bool Says(const std::string& text) const { return failure_.find(text) != std::string::npos; }
  Tarnik::Http::PendingRequestItem* Item() const { return item_.get(); }

  /// It has ended with this answer; without one, it has failed.
  void RequireEnd(const std::optional<ParsedAnswer>& expected) const;

 private:
  int count_ = 0;
  bool isTimeout_ = false;
  bool isCancelled_ = false;
  std::string failure_;
  std::optional<ParsedAnswer> result_;
  Tarnik::Ref<Tarnik::Http::PendingRequestItem> item_;
};

/// An agent with what it needs.
struct HttpCallSetting {
  explicit HttpCallSetting(const HttpCallPlan& plan);
  HttpCallSetting(const HttpCallPlan& plan, Tarnik::Testing::ScriptedSpec::Script script,
                  Tarnik::Http::ConnectionPool* pool = nullptr);

  /// The latest one.
  Tarnik::Testing::ScriptedStream& Stream() const;
  bool HasFaulted() const { return spec->Last() != nullptr && spec->Last()->HasFaulted(); }

  Tarnik::Ref<Tarnik::Testing::ScriptedSpec> scripted;
  Tarnik::Ref<FaultySpec> spec;
  Tarnik::Ref<FaultyCookies> cookies;
  Tarnik::Ref<Tarnik::Http::CallLimit> limit;
  Tarnik::Ref<Tarnik::Http::UserAgent> agent;
};

/// Removes one request from `wire`, which must be that of the plan.
void RequireWritten(std::string& wire, const HttpCallPlan& plan, const HttpCallSetting& setting);

}  // namespace Fuzz

#endif
