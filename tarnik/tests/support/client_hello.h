#ifndef TARNIK_TESTS_SUPPORT_CLIENT_HELLO_H
#define TARNIK_TESTS_SUPPORT_CLIENT_HELLO_H

#include <cstddef>
#include <cstdio>
#include <future>
#include <stdexcept>
#include <string>
#include <string_view>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/system/stream.h>
#include <tarnik/system/thread_pool.h>

namespace Tarnik::Testing {

/// Keeps the first bytes that are written to it and answers nothing.
class FirstWrite final : public System::Stream, public ObjectImpl {
 public:
  void ReadAsync(char* /*buffer*/, std::size_t /*size*/, ReadCompletion completion) override {
    System::GetThreadPool()->Post([completion = std::move(completion)] { completion(0, nullptr); });
  }
  void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override {
    if (bytes_.empty()) {
      bytes_.assign(data, size);
    }
    System::GetThreadPool()->Post([completion = std::move(completion)] { completion(nullptr); });
  }
  void Close() noexcept override {}

  const std::string& Bytes() const { return bytes_; }

 private:
  std::string bytes_;
};

/// The record with the ClientHello that connections of `context` start with.
inline std::string ClientHelloOf(Ssl::SSLContext& context) {
  const auto below = MakeRef<FirstWrite>();
  const auto stream = context.WrapStream(below.get(), "");
  std::promise<void> ended;
  stream->HandshakeClientAsync("sts.example", "", [&ended](Exception*) { ended.set_value(); });
  ended.get_future().wait();
  return below->Bytes();
}

/// The numbers of a TLS message in turn (RFC 8446, section 3).
class TlsNumbers {
 public:
  explicit TlsNumbers(std::string_view bytes) : bytes_(bytes) {}

  std::size_t Next(std::size_t length) {
    std::size_t number = 0;
    for (const char byte : Take(length)) {
      number = number << 8 | static_cast<unsigned char>(byte);
    }
    return number;
  }
  std::string_view Take(std::size_t length) {
    if (length > bytes_.size()) {
      throw std::runtime_error("the message is too short");
    }
    const std::string_view taken = bytes_.substr(0, length);
    bytes_.remove_prefix(length);
    return taken;
  }
  /// A vector whose length is in the next `prefix` bytes.
  std::string_view TakeVector(std::size_t prefix) { return Take(Next(prefix)); }
  bool IsAtEnd() const { return bytes_.empty(); }

 private:
  std::string_view bytes_;
};

inline std::string ListOfCodes(std::string_view codes) {
  std::string text;
  char code[8];
  for (TlsNumbers numbers(codes); !numbers.IsAtEnd();) {
    std::snprintf(code, sizeof(code), " %04zx", numbers.Next(2));
    text += code;
  }
  return text + "\n";
}

/// What a ClientHello offers, in a line each: suites, groups, signature algorithms and versions as
/// code points, and the numbers of its extensions.
inline std::string OfferOf(const std::string& record) {
  TlsNumbers numbers(std::string_view(record).substr(5 + 4));
  numbers.Take(2 + 32);
  numbers.TakeVector(1);
  std::string offer = "suites" + ListOfCodes(numbers.TakeVector(2));
  offer += "compression " + std::to_string(numbers.TakeVector(1).size()) + "\n";
  std::string present = "extensions";
  for (TlsNumbers extensions(numbers.TakeVector(2)); !extensions.IsAtEnd();) {
    const std::size_t type = extensions.Next(2);
    TlsNumbers content(extensions.TakeVector(2));
    present += " " + std::to_string(type);
    if (type == 10) {
      offer += "groups" + ListOfCodes(content.TakeVector(2));
    } else if (type == 13) {
      offer += "signatures" + ListOfCodes(content.TakeVector(2));
    } else if (type == 43) {
      offer += "versions" + ListOfCodes(content.TakeVector(1));
    } else if (type == 45) {
      offer += "key exchange modes " + std::to_string(content.TakeVector(1).size()) + "\n";
    }
  }
  return offer + present + "\n";
}

}  // namespace Tarnik::Testing

#endif
