#ifndef TARNIK_TESTS_SUPPORT_SCRIPTED_SPEC_H
#define TARNIK_TESTS_SUPPORT_SCRIPTED_SPEC_H

#include <cstddef>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/http/connection_spec.h>

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
    /// Presents streams as TLS streams.
    bool isTls = false;
    /// The script of every stream.
    ScriptedStream::Script stream;
    /// If not empty, connecting fails with an `IOException` with this message.
    std::string connectError = {};
    /// If not empty, starting to connect throws an `InvalidArgumentException` with this message.
    std::string startError = {};
    /// Connecting waits until its item is cancelled or `ReleaseConnect` is called.
    bool holdConnects = false;
    /// Runs before the start of a connect returns; the completion may run meanwhile.
    std::function<void()> beforeStartReturns = {};
    /// Connecting succeeds without a stream.
    bool omitsStream = false;
  };

  explicit ScriptedSpec(Script script) : script_(std::move(script)) {}

  std::string Host() const override { return script_.host; }
  std::string CookieHost() const override { return script_.cookieHost; }
  std::string EndpointKey() const override { return script_.endpointKey; }
  bool IsProxy() const override { return script_.isProxy; }
  Ref<System::CancellableItem> StartConnect(ConnectCompletion completion) override;

  /// The streams opened so far. The result keeps them alive.
  std::vector<Ref<ScriptedStream>> Streams() const;
  std::size_t ConnectCount() const;
  std::size_t CancelCount() const;
  /// Drops the references to the streams.
  void ForgetStreams();
  /// Completes a held connect with a stream.
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
