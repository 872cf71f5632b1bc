#include <iostream>
#include <string>

#include <ssoclient/access/call_context.h>
#include <ssoclient/access/failure_kind.h>
#include <ssoclient/ssoclient.h>

namespace {

using SsoClient::Access::FailureKind;

bool ClassifiesRefusedLogins() {
  const FailureKind kind =
      SsoClient::Access::Classify(SsoClient::InvalidCredentialsException("refused"));
  return kind == FailureKind::kRefusedLogin &&
         SsoClient::Access::NameOf(kind) == std::string("refused-login") &&
         !SsoClient::Access::AllowsFailover(kind);
}

bool ReportsCancellation() {
  const SsoClient::Access::CancellationSource source;
  bool hasRun = false;
  const auto registration = source.Token().OnCancel([&hasRun] { hasRun = true; });
  source.Cancel();
  return hasRun;
}

}  // namespace

int main() {
  if (!ClassifiesRefusedLogins() || !ReportsCancellation()) {
    std::cerr << "The installed library of token sources does not work as expected.\n";
    return 1;
  }
  std::cout << "The installed library of token sources works.\n";
  return 0;
}
