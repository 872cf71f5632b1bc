#ifndef BENCH_BARE_CLIENT_H
#define BENCH_BARE_CLIENT_H

#include <memory>
#include <string>

namespace Bench {

/// The least that an exchange over TLS can cost: blocking calls of Boost.Beast that send given
/// bytes and read an answer, with a connection for each. Trusts one CA and checks the peer's name,
/// and resumes TLS sessions that the peer hands out. For one thread.
class BareClient {
 public:
  BareClient(const std::string& caFile, const std::string& host, unsigned short port);
  ~BareClient();
  /// Sends the bytes of a whole HTTP request and returns the answer's body. Throws when anything
  /// fails, an HTTP status other than 200 included.
  std::string Exchange(const std::string& request);
  /// How many of the exchanges resumed a session.
  std::size_t Resumed() const;

 private:
  struct State;
  std::unique_ptr<State> state_;
};

}  // namespace Bench

#endif
