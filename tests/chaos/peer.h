#ifndef SSOCLIENT_TESTS_CHAOS_PEER_H
#define SSOCLIENT_TESTS_CHAOS_PEER_H

#include <cstddef>
#include <initializer_list>
#include <memory>
#include <string>
#include <typeindex>

#include <devsts/server.h>
#include <ssoclient/ssoclient.h>
#include <tarnik/http/bounded_user_agent.h>

#include "chaos/run.h"
#include "integration/operation.h"

namespace SsoClient::Testing {

/// A dev STS and clients of it that can perform every operation.
class Peer {
 public:
  Peer();

  DevSts::Server& Sts() { return sts_; }
  const SecurityTokenService& Service(bool hasTls) const { return hasTls ? *tls_ : *plain_; }
  /// A client that reaches the STS by the name localhost, which needs a look-up.
  const SecurityTokenService& ServiceByName() const { return *named_; }
  /// A client that ends its calls at `limit`.
  std::shared_ptr<SecurityTokenService> ServiceWithin(Tarnik::Http::CallLimit& limit, bool hasTls,
                                                      int port) const;
  /// Arguments that the STS accepts. Its memory of issued tokens is limited, so the token is
  /// replaced now and then.
  const Testing::Arguments& Arguments();

  /// Performs every operation over both transports, so that threads and caches exist, and waits
  /// until the STS has closed its connections.
  void WarmUp(const Run& run);
  /// Requires that the STS has no connection any more.
  void AwaitIdle(const Run& run) const;

 private:
  DevSts::Server sts_;
  std::shared_ptr<SecurityTokenService> plain_;
  std::shared_ptr<SecurityTokenService> tls_;
  std::shared_ptr<SecurityTokenService> named_;
  Testing::Arguments arguments_;
  std::size_t uses_ = 0;
};

/// "AcquireToken over TLS"
std::string CallName(Operation operation, bool hasTls);

/// Requires that the operation has ended with a token of the requested subject, or a positive
/// verdict.
void RequireSuccess(const Run& run, Operation operation, const Outcome& outcome);
/// Requires that it has ended with one of these classes exactly, and with nothing else.
void RequireFailure(const Run& run, const Outcome& outcome,
                    std::initializer_list<std::type_index> classes);

}  // namespace SsoClient::Testing

#endif
