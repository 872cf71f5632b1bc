#ifndef BENCH_FLOOR_H
#define BENCH_FLOOR_H

#include <memory>
#include <string>

namespace Bench {

/// The lower bound of the cost of checking a signed text: one RSA-2048 verification and SHA-256 of
/// the bytes. Algorithms are fetched and keys are loaded in the constructor.
class Floor {
 public:
  Floor();
  ~Floor();
  /// Digests `text` and returns whether the prepared signature verifies.
  bool Check(const std::string& text);

 private:
  struct State;
  std::unique_ptr<State> state_;
};

}  // namespace Bench

#endif
