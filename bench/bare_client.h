#ifndef BENCH_BARE_CLIENT_H
#define BENCH_BARE_CLIENT_H

#include <memory>
#include <string>

namespace Bench {

/// The lower bound of the cost of an exchange over TLS: blocking calls of Boost.Beast that send the
/// given bytes and read the answer, over a new connection each time. Trusts one CA, checks the
/// peer's name and resumes the peer's TLS sessions. For one thread.
class BareClient {
 public:
  BareClient(const std::string& caFile, const std::string& host, unsigned short port);
  ~BareClient();
  /// Sends a complete HTTP request and returns the body of the answer. Throws on any failure,
  /// including an HTTP status other than 200.
  std::string Exchange(const std::string& request);
  /// The number of exchanges that resumed a session.
  std::size_t Resumed() const;

 private:
  struct State;
  std::unique_ptr<State> state_;
};

}  // namespace Bench

#endif
