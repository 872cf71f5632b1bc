#ifndef BENCH_FLOOR_H
#define BENCH_FLOOR_H

#include <memory>
#include <string>

namespace Bench {

/// The least that checking a signed text can cost: one RSA-2048 verification and SHA-256 of the
/// bytes, with everything fetched and loaded before.
class Floor {
 public:
  Floor();
  ~Floor();
  /// True when the prepared signature verifies; `text` is digested besides.
  bool Check(const std::string& text);

 private:
  struct State;
  std::unique_ptr<State> state_;
};

}  // namespace Bench

#endif
