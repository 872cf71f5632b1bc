#ifndef SSOCLIENT_ACCESS_TESTS_END_TO_END_TOKEN_CALLS_H
#define SSOCLIENT_ACCESS_TESTS_END_TO_END_TOKEN_CALLS_H

#include <chrono>
#include <cstddef>
#include <memory>
#include <string>
#include <typeinfo>
#include <vector>

#include <ssoclient/access/token_source.h>

namespace SsoClient::Access::Testing {

/// What a call has given, and when.
struct Result {
  std::shared_ptr<const SamlToken> token;
  std::string type;  ///< the class of the exception; empty with a token
  std::string message;
  std::chrono::steady_clock::time_point ended;
  int reports = 0;

  template <class Exception>
  bool Is() const {
    return type == typeid(Exception).name();
  }
};

/// Calls and waits.
Result Get(TokenSource& source, const TokenSpec& spec, const CallContext& context = {});

/// Asynchronous calls, which may outlive this object. Used by one thread.
class TokenCalls {
 public:
  TokenCalls();

  void Begin(TokenSource& source, const TokenSpec& spec, const CallContext& context = {});
  std::size_t Size() const { return size_; }
  /// Waits until all calls have reported, and returns what each has given, in the order in which
  /// they were begun. The test fails if that takes more than a minute.
  std::vector<Result> Wait() const;
  /// The calls that have reported until now.
  std::size_t Reported() const;

 private:
  struct State;
  std::shared_ptr<State> state_;
  std::size_t size_ = 0;
};

/// A spec for ten minutes and one audience.
TokenSpec SpecFor(const std::string& audience);
/// The same for an audience with a number.
TokenSpec SpecFor(std::size_t number);

}  // namespace SsoClient::Access::Testing

#endif
