#ifndef BENCH_PEER_H
#define BENCH_PEER_H

#include <memory>
#include <string>

namespace Bench {

/// The same check by xmlsec1 on libxml2: parses the token, registers its id and verifies its only
/// signature with a bare public key, which the constructor makes once. Reads nothing else of the
/// token.
class Peer {
 public:
  explicit Peer(const std::string& certificatePem);
  ~Peer();
  bool Check(const std::string& xml);

 private:
  struct State;
  std::unique_ptr<State> state_;
};

}  // namespace Bench

#endif
