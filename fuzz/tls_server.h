#ifndef FUZZ_TLS_SERVER_H
#define FUZZ_TLS_SERVER_H

#include <cstddef>
#include <deque>
#include <string>

#include <fuzzer/FuzzedDataProvider.h>
#include <openssl/ssl.h>

#include <tarnik/core/object_impl.h>
#include <tarnik/system/stream.h>

#include "support/openssl.h"

namespace Fuzz {

/// A stream whose other end is a TLS server of OpenSSL's in memory. The input decides what the
/// server sends, what happens to its records on the way, and in which pieces they arrive.
/// Everything happens on one thread, in `Drive` and `RunCompletions`.
class TlsServer final : public Tarnik::System::Stream, public Tarnik::ObjectImpl {
 public:
  TlsServer(SSL_CTX* context, FuzzedDataProvider& input);

  void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) override;
  void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override;
  void Close() noexcept override;

  /// Lets the server work and the records arrive; false if nothing has changed.
  bool Drive();
  /// Nothing more arrives: the end of the stream, or a failure of it.
  void End(bool isOrderly);

  /// Whether every record has arrived as it was sent.
  bool IsClean() const { return isClean_; }
  bool HasSentCloseNotify() const { return hasSentCloseNotify_; }
  SSL* Ssl() const { return ssl_.get(); }
  bool WasResumed() const { return SSL_session_reused(ssl_.get()) == 1; }
  /// The data that the server has sent and received.
  const std::string& Sent() const { return sent_; }
  const std::string& Received() const { return received_; }

 private:
  bool Work();
  void SendData();
  void TakeRecords();
  void Transmit(std::string record);
  bool Deliver();
  void Complete(std::size_t size, bool hasFailed);

  FuzzedDataProvider& input_;
  Tarnik::OpenSsl::OwnedSsl ssl_;
  bool isAccepted_ = false;
  bool hasFailed_ = false;
  bool isSilent_ = false;  // it has sent everything
  bool hasSentCloseNotify_ = false;
  bool isClean_ = true;
  int messages_;
  std::string sent_;
  std::string received_;
  std::string heldRecord_;
  std::string wire_;
  bool isCut_ = false;
  bool hasEnd_ = false;
  bool endsOrderly_ = true;
  bool isClosed_ = false;
  char* buffer_ = nullptr;
  std::size_t size_ = 0;
  ReadCompletion read_;
};

}  // namespace Fuzz

#endif
