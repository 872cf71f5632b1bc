#ifndef TARNIK_TESTS_SUPPORT_SCRIPTED_SPEC_H
#define TARNIK_TESTS_SUPPORT_SCRIPTED_SPEC_H

#include <tarnik/core/object_impl.h>
#include <tarnik/http/connection_spec.h>

#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "support/scripted_stream.h"

namespace Tarnik::Testing {

/// A connection spec whose connections are scripted streams.
class ScriptedSpec final : public Http::CustomConnectionSpec, public ObjectImpl {
 public:
  struct Script {
    std::string host = "sts.example";
    std::string cookieHost = "sts.example";
    std::string endpointKey = "sts.example:443";
    bool isProxy = false;
    /// Streams are presented as TLS.
    bool isTls = false;
    /// Every stream's script.
    ScriptedStream::Script stream;
    /// Not empty: connecting fails with an `IOException` that says so.
    std::string connectError = {};
    /// Not empty: starting to connect throws an `InvalidArgumentException` that says so.
    std::string startError = {};
    /// Connecting ends with a `CancelledException`, by the item, or not at all.
    bool holdConnects = false;
    /// Runs before the start of a connect returns, whose completion may run meanwhile.
    std::function<void()> beforeStartReturns = {};
    /// Connecting succeeds without giving a stream.
    bool givesNoStream = false;
  };

  explicit ScriptedSpec(Script script) : script_(std::move(script)) {}

  std::string Host() const override { return script_.host; }
  std::string CookieHost() const override { return script_.cookieHost; }
  std::string EndpointKey() const override { return script_.endpointKey; }
  bool IsProxy() const override { return script_.isProxy; }
  Ref<System::CancellableItem> StartConnect(ConnectCompletion completion) override;

  /// The streams opened so far. A test that asks for them keeps them alive.
  std::vector<Ref<ScriptedStream>> Streams() const;
  std::size_t ConnectCount() const;
  std::size_t CancelCount() const;
  /// Lets the streams go.
  void ForgetStreams();
  /// Completes a connect that the script holds, with a stream.
  void ReleaseConnect();

 private:
  struct Held {
    std::mutex mutex;
    ConnectCompletion completion;
    std::size_t cancelCount = 0;
  };

  ~ScriptedSpec() override = default;

  void Complete(const ConnectCompletion& completion);

  const Script script_;
  const std::shared_ptr<Held> held_ = std::make_shared<Held>();
  mutable std::mutex mutex_;
  std::vector<Ref<ScriptedStream>> streams_;
  std::size_t connectCount_ = 0;
};

/// Answers every request with `answer`.
ScriptedStream::WriteHook AnswerWith(std::string answer);

}  // namespace Tarnik::Testing

#endif
