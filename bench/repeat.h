#ifndef BENCH_REPEAT_H
#define BENCH_REPEAT_H

#include <functional>
#include <string>

#include "sample_token.h"

namespace Bench {

/// What all runs have in common.
struct RepeatInputs {
  SampleToken token;
  std::string clientCertificatePem;
  std::string clientKeyPem;
};

/// Returns the operation with this name, ready to be called any number of times, or an empty
/// function for an unknown name. Each program that is linked with repeat.cpp defines it.
std::function<void()> PrepareOperation(const std::string& name, const RepeatInputs& inputs);

}  // namespace Bench

#endif
