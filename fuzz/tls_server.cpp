#include "tls_server.h"

#include <algorithm>
#include <utility>

#include <openssl/err.h>

#include <tarnik/core/exception.h>
#include <tarnik/system/thread_pool.h>

namespace Fuzz {
namespace {

constexpr std::size_t kHeaderSize = 5;

// What happens to a record on its way; most arrive.
enum class Fate {
  kArrives,
  kChanges = 24,
  kIsLost,
  kComesTwice,
  kIsOvertaken,
  kIsCut,
  kFollowsOthers
};

void Post(std::function<void()> completion) {
  Tarnik::System::GetThreadPool()->Post(std::move(completion));
}

}  // namespace

TlsServer::TlsServer(SSL_CTX* context, FuzzedDataProvider& input)
    : input_(input), ssl_(SSL_new(context)), messages_(input.ConsumeIntegralInRange(0, 3)) {
  SSL_set0_rbio(ssl_.get(), BIO_new(BIO_s_mem()));
  SSL_set0_wbio(ssl_.get(), BIO_new(BIO_s_mem()));
  SSL_set_accept_state(ssl_.get());
}

void TlsServer::ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) {
  buffer_ = buffer;
  size_ = size;
  read_ = std::move(completion);
  if (isClosed_) {
    Complete(0, true);
  }
}

void TlsServer::WriteAsync(const char* data, std::size_t size, WriteCompletion completion) {
  if (isClosed_) {
    Post([completion = std::move(completion)] {
      Tarnik::CancelledException error("closed");
      completion(&error);
    });
    return;
  }
  BIO_write(SSL_get_rbio(ssl_.get()), data, static_cast<int>(size));
  Post([completion = std::move(completion)] { completion(nullptr); });
}

void TlsServer::Close() noexcept {
  isClosed_ = true;
  if (read_) {
    Complete(0, true);
  }
}

bool TlsServer::Drive() {
  const bool hasWorked = Work();
  TakeRecords();
  return Deliver() || hasWorked;
}

bool TlsServer::Work() {
  if (hasFailed_) {
    return false;
  }
  const bool wasAccepted = isAccepted_;
  const std::size_t before = sent_.size() + received_.size();
  if (!isAccepted_) {
    const int result = SSL_accept(ssl_.get());
    isAccepted_ = result == 1;
    hasFailed_ = !isAccepted_ && SSL_get_error(ssl_.get(), result) != SSL_ERROR_WANT_READ;
  }
  if (isAccepted_) {
    char buffer[4096];
    int count = 0;
    while ((count = SSL_read(ssl_.get(), buffer, sizeof(buffer))) > 0) {
      received_.append(buffer, static_cast<std::size_t>(count));
    }
    hasFailed_ = SSL_get_error(ssl_.get(), count) != SSL_ERROR_WANT_READ;
    if (!hasFailed_ && !isSilent_) {
      SendData();
    }
  }
  ERR_clear_error();
  return isAccepted_ != wasAccepted || sent_.size() + received_.size() != before;
}

void TlsServer::SendData() {
  if (messages_ > 0) {
    --messages_;
    std::string message(input_.ConsumeIntegralInRange<std::size_t>(1, 20'000), '\0');
    for (std::size_t i = 0; i < message.size(); ++i) {
      message[i] = static_cast<char>('a' + (sent_.size() + i) % 23);
    }
    if (SSL_version(ssl_.get()) == TLS1_3_VERSION && input_.ConsumeIntegralInRange(0, 7) == 7) {
      SSL_key_update(ssl_.get(), SSL_KEY_UPDATE_REQUESTED);
    }
    SSL_write(ssl_.get(), message.data(), static_cast<int>(message.size()));
    sent_ += message;
    return;
  }
  if (!hasSentCloseNotify_ && input_.ConsumeIntegralInRange(0, 3) != 3) {
    SSL_shutdown(ssl_.get());
    hasSentCloseNotify_ = true;
  }
  isSilent_ = true;
}

void TlsServer::TakeRecords() {
  char* output = nullptr;
  const long length = BIO_get_mem_data(SSL_get_wbio(ssl_.get()), &output);
  std::string bytes(output, static_cast<std::size_t>(length));
  BIO_reset(SSL_get_wbio(ssl_.get()));
  while (bytes.size() >= kHeaderSize) {
    const std::size_t size = kHeaderSize + static_cast<unsigned char>(bytes[3]) * 256U +
                             static_cast<unsigned char>(bytes[4]);
    Transmit(bytes.substr(0, size));
    bytes.erase(0, size);
  }
}

void TlsServer::Transmit(std::string record) {
  const auto fate = static_cast<Fate>(input_.ConsumeIntegralInRange(0, 29));
  isClean_ = isClean_ && fate < Fate::kChanges;
  if (isCut_) {
    return;
  }
  switch (fate) {
    case Fate::kChanges: {
      const std::size_t place = input_.ConsumeIntegralInRange<std::size_t>(0, record.size() - 1);
      record[place] = static_cast<char>(record[place] ^ input_.ConsumeIntegralInRange(1, 255));
      break;
    }
    case Fate::kIsLost:
      return;
    case Fate::kComesTwice:
      wire_ += record;
      break;
    case Fate::kIsOvertaken:
      heldRecord_ += record;
      return;
    case Fate::kIsCut:
      record.resize(input_.ConsumeIntegralInRange<std::size_t>(0, record.size() - 1));
      isCut_ = true;
      break;
    case Fate::kFollowsOthers:
      wire_ += input_.ConsumeRandomLengthString(40);
      break;
    default:
      break;
  }
  wire_ += record + std::exchange(heldRecord_, "");
}

bool TlsServer::Deliver() {
  if (!read_) {
    return false;
  }
  if (wire_.empty()) {
    if (hasEnd_) {
      Complete(0, !endsOrderly_);
    }
    return hasEnd_;
  }
  const std::size_t limit = std::min(size_, wire_.size());
  const std::size_t piece = input_.ConsumeIntegralInRange(0, 3) == 0
                                ? limit
                                : input_.ConsumeIntegralInRange<std::size_t>(1, limit);
  std::copy_n(wire_.begin(), piece, buffer_);
  wire_.erase(0, piece);
  Complete(piece, false);
  return true;
}

void TlsServer::Complete(std::size_t size, bool hasFailed) {
  Post([completion = std::exchange(read_, nullptr), size, hasFailed, isClosed = isClosed_] {
    if (!hasFailed) {
      completion(size, nullptr);
    } else if (isClosed) {
      Tarnik::CancelledException error("closed");
      completion(0, &error);
    } else {
      Tarnik::IOException error("reset");
      completion(0, &error);
    }
  });
}

void TlsServer::End(bool isOrderly) {
  hasEnd_ = true;
  endsOrderly_ = isOrderly;
}

}  // namespace Fuzz
