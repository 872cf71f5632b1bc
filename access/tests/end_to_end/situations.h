#ifndef SSOCLIENT_ACCESS_TESTS_END_TO_END_SITUATIONS_H
#define SSOCLIENT_ACCESS_TESTS_END_TO_END_SITUATIONS_H

#include <functional>
#include <memory>
#include <ostream>
#include <string>

#include "end_to_end/end_to_end_fixture.h"

namespace SsoClient::Access::Testing {

/// Makes a call wait in one stage.
class Situation {
 public:
  virtual ~Situation() = default;

  virtual TokenSourceConfig Config() = 0;
  virtual TokenSpec Spec() const { return SpecFor("https://orders.example.com"); }
  /// Called with the new source, before the call.
  virtual void Prepare(TokenSource& /*source*/) {}
  /// Waits until the call is in the stage.
  virtual bool Await(const TokenSource& source, const AwaitingListener& listener) = 0;
  /// Waits until nothing is left of a call that has ended. Nothing waits for it any more.
  virtual bool AwaitNothingLeft() { return true; }
};

struct Stage {
  const char* name;
  const char* waitingFor;  ///< as the message of a deadline says it, without the URL
  std::function<std::unique_ptr<Situation>()> make;
};

std::ostream& operator<<(std::ostream& stream, const Stage& stage);

/// All stages of a call.
std::vector<Stage> AllStages();

}  // namespace SsoClient::Access::Testing

#endif
