#include "support/memory_tls_peer.h"

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <functional>
#include <mutex>
#include <utility>

#include <openssl/err.h>

#include <tarnik/core/exception.h>
#include <tarnik/system/thread_pool.h>

namespace Tarnik::Testing {

MemoryTlsPeer::MemoryTlsPeer(SSL_CTX* serverContext, Behaviour behaviour)
    : behaviour_(std::move(behaviour)), ssl_(SSL_new(serverContext)) {
  SSL_set0_rbio(ssl_.get(), BIO_new(BIO_s_mem()));
  SSL_set0_wbio(ssl_.get(), BIO_new(BIO_s_mem()));
  SSL_set_accept_state(ssl_.get());
}

void MemoryTlsPeer::ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) {
  const std::lock_guard lock(mutex_);
  buffer_ = buffer;
  size_ = size;
  read_ = std::move(completion);
  CompleteRead();
}

void MemoryTlsPeer::WriteAsync(const char* data, std::size_t size, WriteCompletion completion) {
  const std::lock_guard lock(mutex_);
  if (closed_) {
    Post([completion = std::move(completion)] {
      CancelledException error("closed in memory");
      completion(&error);
    });
    return;
  }
  if (writes_++ == behaviour_.failingWrite) {
    Post([completion = std::move(completion)] {
      IOException error("write failed in memory");
      completion(&error);
    });
    return;
  }
  BIO_write(SSL_get_rbio(ssl_.get()), data, static_cast<int>(size));
  Drive();
  Post([completion = std::move(completion)] { completion(nullptr); });
  CompleteRead();
}

void MemoryTlsPeer::Close() noexcept {
  const std::lock_guard lock(mutex_);
  closed_ = true;
  CompleteRead();
}

void MemoryTlsPeer::Drive() {
  if (SSL_accept(ssl_.get()) == 1 && !greeted_) {
    greeted_ = true;
    // Two records, so that there is a boundary between them.
    const std::size_t half = behaviour_.greeting.size() / 2;
    SSL_write(ssl_.get(), behaviour_.greeting.data(), static_cast<int>(half));
    SSL_write(ssl_.get(), behaviour_.greeting.data() + half,
              static_cast<int>(behaviour_.greeting.size() - half));
    SSL_shutdown(ssl_.get());
  }
  ERR_clear_error();
  char* output = nullptr;
  const long length = BIO_get_mem_data(SSL_get_wbio(ssl_.get()), &output);
  made_.append(output, static_cast<std::size_t>(length));
  BIO_reset(SSL_get_wbio(ssl_.get()));
}

void MemoryTlsPeer::CompleteRead() {
  if (!read_) {
    return;
  }
  if (closed_) {
    Post([completion = std::exchange(read_, nullptr)] {
      CancelledException error("closed in memory");
      completion(0, &error);
    });
    return;
  }
  const std::size_t end = std::min(made_.size(), behaviour_.cutAfter);
  const std::size_t given = std::min({end - delivered_, size_, behaviour_.pieceSize});
  if (given > 0) {
    std::memcpy(buffer_, made_.data() + delivered_, given);
    delivered_ += given;
    Post([completion = std::exchange(read_, nullptr), given] { completion(given, nullptr); });
    return;
  }
  if (delivered_ < behaviour_.cutAfter || behaviour_.atCut == AtCut::kSilence) {
    return;
  }
  Post([completion = std::exchange(read_, nullptr), atCut = behaviour_.atCut] {
    IOException reset("reset in memory");
    completion(0, atCut == AtCut::kReset ? &reset : nullptr);
  });
}

void MemoryTlsPeer::Post(std::function<void()> completion) {
  System::GetThreadPool()->Post(std::move(completion));
}

std::size_t MemoryTlsPeer::BytesMade() const {
  const std::lock_guard lock(mutex_);
  return made_.size();
}

std::size_t MemoryTlsPeer::Writes() const {
  const std::lock_guard lock(mutex_);
  return writes_;
}

bool MemoryTlsPeer::IsClosed() const {
  const std::lock_guard lock(mutex_);
  return closed_;
}

}  // namespace Tarnik::Testing
