#ifndef SSOCLIENT_TESTS_TRANSPORT_FAKE_SSL_H
#define SSOCLIENT_TESTS_TRANSPORT_FAKE_SSL_H

#include <atomic>
#include <cstddef>
#include <optional>
#include <string>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/ssl/ssl_exception.h>
#include <tarnik/system/thread_pool.h>

namespace SsoClient::Testing {

class FakeSslContext;

/// Passes all data to the stream below, unencrypted.
class FakeSslStream final : public Tarnik::Ssl::SSLStream, public Tarnik::ObjectImpl {
 public:
  FakeSslStream(Tarnik::Ref<FakeSslContext> context, Tarnik::System::Stream* below)
      : context_(std::move(context)), below_(below) {}

  void HandshakeClientAsync(const std::string& host, const std::string& serverName,
                            HandshakeCompletion completion) override;
  void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) override {
    below_->ReadAsync(buffer, size, std::move(completion));
  }
  void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override {
    below_->WriteAsync(data, size, std::move(completion));
  }
  void Close() noexcept override { below_->Close(); }

 private:
  Tarnik::Ref<FakeSslContext> context_;
  Tarnik::Ref<Tarnik::System::Stream> below_;
};

/// Records the calls of its streams. Handshakes fail with `handshakeFailure` if it is set. If
/// `handshakeRefusal` is set, they throw it before they begin.
class FakeSslContext final : public Tarnik::Ssl::SSLContext, public Tarnik::ObjectImpl {
 public:
  Tarnik::Ref<Tarnik::Ssl::SSLStream> WrapStream(Tarnik::System::Stream* stream,
                                                 const std::string& name) override {
    ++wraps;
    label = name;
    return Tarnik::MakeRef<FakeSslStream>(Tarnik::Ref<FakeSslContext>(this), stream);
  }

  std::atomic<int> wraps = 0;
  std::string label = "none";
  std::string host;
  std::string serverName;
  std::optional<std::string> handshakeFailure;
  std::optional<std::string> handshakeRefusal;
};

inline void FakeSslStream::HandshakeClientAsync(const std::string& host,
                                                const std::string& serverName,
                                                HandshakeCompletion completion) {
  context_->host = host;
  context_->serverName = serverName;
  if (context_->handshakeRefusal) {
    throw Tarnik::InvalidArgumentException(*context_->handshakeRefusal);
  }
  Tarnik::System::GetThreadPool()->Post(
      [failure = context_->handshakeFailure, completion = std::move(completion)] {
        if (!failure) {
          completion(nullptr);
          return;
        }
        Tarnik::Ssl::SSLException error(*failure);
        completion(&error);
      });
}

}  // namespace SsoClient::Testing

#endif
