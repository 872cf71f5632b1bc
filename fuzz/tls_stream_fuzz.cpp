// The records of a TLS server arrive in pieces, changed, lost, twice, in another order or cut off,
// as the input says. The data that a stream reads is always the beginning of what the server has
// sent, its end is reported only at the server's close_notify, failures are typed, and every
// operation ends exactly once. Without a fault everything arrives, in both directions.
#include <algorithm>
#include <string>

#include <fuzzer/FuzzedDataProvider.h>
#include <openssl/err.h>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/ssl/ssl_exception.h>

#include "fixed_random.h"
#include "input.h"
#include "single_thread.h"
#include "tls_server.h"
#include "tls_setting.h"

namespace {

using namespace Tarnik;

/// The end of one operation.
struct Outcome {
  int count = 0;
  bool hasFailed = false;
  std::size_t size = 0;

  void Report(const Exception* error, std::size_t bytes = 0) {
    Fuzz::Require(++count == 1);
    hasFailed = error != nullptr;
    size = bytes;
    Fuzz::Require(error == nullptr || dynamic_cast<const Ssl::SSLException*>(error) != nullptr ||
                  dynamic_cast<const IOException*>(error) != nullptr ||
                  dynamic_cast<const CancelledException*>(error) != nullptr);
  }
  bool HasSucceeded() const { return count == 1 && !hasFailed; }
};

/// One connection of a client.
class Connection {
 public:
  Connection(Ssl::SSLContext& context, SSL_CTX* serverContext, FuzzedDataProvider& input)
      : input_(input),
        server_(MakeRef<Fuzz::TlsServer>(serverContext, input)),
        stream_(context.WrapStream(server_.get(), "")) {}

  void Run(const Fuzz::TlsSetting& setting) {
    RequireNotReady();
    Outcome handshake;
    stream_->HandshakeClientAsync(setting.Host(), "",
                                  [&](Exception* error) { handshake.Report(error); });
    Finish(handshake);
    const bool isConnected = handshake.HasSucceeded();
    // With TLS 1.3, the server refuses a client without a certificate only after the handshake.
    const bool mayLackCertificate = setting.IsTls13() && setting.IsServerAcceptable();
    Fuzz::Require(!isConnected || setting.IsAcceptable() || mayLackCertificate);
    Fuzz::Require(isConnected || !setting.IsAcceptable() || !server_->IsClean());
    if (isConnected) {
      Exchange(setting);
    }
    stream_->Close();
    Settle();
  }

 private:
  // Before the handshake, and while another write is under way.
  void RequireNotReady() {
    bool isRefused = false;
    try {
      stream_->WriteAsync("x", 1, [](Exception*) { Fuzz::Require(false); });
    } catch (const InvalidStateException&) {
      isRefused = true;
    }
    Fuzz::Require(isRefused);
  }

  void Exchange(const Fuzz::TlsSetting& setting) {
    // More than the stream holds at once, sometimes.
    const std::size_t longest = input_.ConsumeIntegralInRange(0, 3) == 3 ? 200'000 : 4'000;
    std::string request(input_.ConsumeIntegralInRange<std::size_t>(0, longest), 'q');
    for (std::size_t i = 0; i < request.size(); ++i) {
      request[i] = static_cast<char>('A' + i % 29);
    }
    Outcome written;
    stream_->WriteAsync(request.data(), request.size(),
                        [&](Exception* error) { written.Report(error); });
    RequireNotReady();
    const bool isComplete = ReadAll();
    Finish(written);
    const std::string& received = server_->Received();
    Fuzz::Require(request.compare(0, received.size(), received) == 0);
    if (server_->IsClean() && setting.IsAcceptable()) {
      Fuzz::Require(read_ == server_->Sent());
      Fuzz::Require(isComplete == server_->HasSentCloseNotify());
      Fuzz::Require(received == request);
    }
  }

  /// Reads to the end; true if that is the end of the data.
  bool ReadAll() {
    std::string buffer;
    for (;;) {
      buffer.assign(input_.ConsumeIntegralInRange<std::size_t>(1, 20'000), '\0');
      Outcome outcome;
      stream_->ReadAsync(buffer.data(), buffer.size(), [&](std::size_t bytes, Exception* error) {
        outcome.Report(error, bytes);
      });
      Finish(outcome);
      if (!outcome.HasSucceeded() || outcome.size == 0) {
        const bool isEnd = outcome.HasSucceeded();
        Fuzz::Require(!isEnd || (server_->HasSentCloseNotify() && read_ == server_->Sent()));
        return isEnd;
      }
      Fuzz::Require(outcome.size <= buffer.size());
      read_.append(buffer, 0, outcome.size);
      Fuzz::Require(server_->Sent().compare(0, read_.size(), read_) == 0);
    }
  }

  void Settle() {
    bool hasChanged = true;
    while (hasChanged) {
      hasChanged = Fuzz::RunCompletions();
      hasChanged = server_->Drive() || hasChanged;
    }
  }

  // An operation that waits for more than has arrived ends with the stream or when it is closed.
  void Finish(const Outcome& outcome) {
    Settle();
    if (outcome.count == 0 && input_.ConsumeBool()) {
      stream_->Close();
    } else if (outcome.count == 0) {
      server_->End(input_.ConsumeBool());
    }
    Settle();
    Fuzz::Require(outcome.count == 1);
  }

  FuzzedDataProvider& input_;
  Ref<Fuzz::TlsServer> server_;
  Ref<Ssl::SSLStream> stream_;
  std::string read_;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  Fuzz::RunOnOneThread();
  FuzzedDataProvider input(data, size);
  const Fuzz::TlsSetting setting(input);
  Fuzz::FixRandomness(size);
  const OpenSsl::OwnedSslContext serverContext = setting.ServerContext();
  const auto context = setting.ClientContext();
  Fuzz::Require((context == nullptr) == setting.HasBrokenFile());
  if (context == nullptr) {
    return 0;
  }
  for (int connections = input.ConsumeIntegralInRange(1, 2); connections > 0; --connections) {
    Connection(*context, serverContext.get(), input).Run(setting);
  }
  Fuzz::Require(ERR_peek_error() == 0);
  return 0;
}
