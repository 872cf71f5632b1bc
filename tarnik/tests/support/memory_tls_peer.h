#ifndef TARNIK_TESTS_SUPPORT_MEMORY_TLS_PEER_H
#define TARNIK_TESTS_SUPPORT_MEMORY_TLS_PEER_H

#include <cstddef>
#include <functional>
#include <limits>
#include <mutex>
#include <string>

#include <tarnik/core/object_impl.h>
#include <tarnik/system/stream.h>

#include "support/openssl.h"

namespace Tarnik::Testing {

/// A stream whose other end is a TLS server in memory, which sends `greeting` after the handshake
/// and then closes gracefully. What it sends can be cut off after any number of bytes and arrives
/// in pieces of a chosen size.
class MemoryTlsPeer final : public System::Stream, public ObjectImpl {
 public:
  enum class AtCut { kEnd, kReset, kSilence };
  struct Behaviour {
    std::string greeting = "hello";
    std::size_t cutAfter = std::numeric_limits<std::size_t>::max();
    AtCut atCut = AtCut::kEnd;
    std::size_t pieceSize = std::numeric_limits<std::size_t>::max();
    /// The write with this number fails; the first is 0.
    std::size_t failingWrite = std::numeric_limits<std::size_t>::max();
  };

  MemoryTlsPeer(SSL_CTX* serverContext, Behaviour behaviour);

  void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) override;
  void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override;
  void Close() noexcept override;

  /// How many bytes the peer has produced so far, whether they are cut off or not.
  std::size_t BytesMade() const;
  std::size_t Writes() const;
  bool IsClosed() const;

 private:
  void Drive();
  void CompleteRead();
  static void Post(std::function<void()> completion);

  const Behaviour behaviour_;
  mutable std::mutex mutex_;
  OpenSsl::OwnedSsl ssl_;
  bool greeted_ = false;
  bool closed_ = false;
  std::string made_;
  std::size_t delivered_ = 0;
  std::size_t writes_ = 0;
  char* buffer_ = nullptr;
  std::size_t size_ = 0;
  ReadCompletion read_;
};

}  // namespace Tarnik::Testing

#endif
