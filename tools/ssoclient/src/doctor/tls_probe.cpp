#include "doctor/tls_probe.h"

#include <algorithm>
#include <array>
#include <stdexcept>

#include <arpa/inet.h>
#include <openssl/err.h>
#include <openssl/ssl.h>

#include "doctor/tcp_probe.h"

namespace SsoClient::Tool::Doctor {
namespace {

using Clock = TimeLimit::Clock;

constexpr std::size_t kFirstOctets = 64;
// Several times what a handshake with long chains has.
constexpr std::size_t kMaxOctets = std::size_t{256} * 1024;

constexpr const char* kLibrarySuites =
    "ECDHE-ECDSA-AES256-GCM-SHA384:ECDHE-RSA-AES256-GCM-SHA384:"
    "ECDHE-ECDSA-CHACHA20-POLY1305:ECDHE-RSA-CHACHA20-POLY1305:"
    "ECDHE-ECDSA-AES128-GCM-SHA256:ECDHE-RSA-AES128-GCM-SHA256";

struct FreeContext {
  void operator()(SSL_CTX* context) const noexcept { SSL_CTX_free(context); }
};
struct FreeSsl {
  void operator()(SSL* ssl) const noexcept { SSL_free(ssl); }
};
using OwnedContext = std::unique_ptr<SSL_CTX, FreeContext>;
using OwnedSsl = std::unique_ptr<SSL, FreeSsl>;

void Require(bool isDone) {
  if (!isDone) {
    throw std::runtime_error("cannot set up the probe of TLS");
  }
}

int RecordRequest(SSL* ssl, X509**, EVP_PKEY**) {
  static_cast<TlsAttempt*>(SSL_get_app_data(ssl))->asksForCertificate = true;
  return 0;  // none is presented
}

void RecordAlert(const SSL* ssl, int where, int value) {
  if ((where & SSL_CB_READ_ALERT) == SSL_CB_READ_ALERT && (value >> 8) == SSL3_AL_FATAL) {
    static_cast<TlsAttempt*>(SSL_get_app_data(ssl))->alert = value & 0xff;
  }
}

OwnedContext MakeContext(TlsOffer offer) {
  OwnedContext context(SSL_CTX_new(TLS_client_method()));
  Require(context != nullptr);
  int lowest = TLS1_2_VERSION;
  int highest = 0;
  const char* suites = kLibrarySuites;
  if (offer != TlsOffer::kLibrary) {
    lowest = offer == TlsOffer::kOldVersion ? TLS1_VERSION : TLS1_2_VERSION;
    highest = offer == TlsOffer::kOldVersion ? TLS1_1_VERSION : TLS1_2_VERSION;
    suites = "ALL:COMPLEMENTOFALL:@SECLEVEL=0";
  }
  Require(SSL_CTX_set_min_proto_version(context.get(), lowest) == 1 &&
          SSL_CTX_set_max_proto_version(context.get(), highest) == 1 &&
          SSL_CTX_set_cipher_list(context.get(), suites) == 1);
  // The chain is verified after the handshake.
  SSL_CTX_set_verify(context.get(), SSL_VERIFY_NONE, nullptr);
  SSL_CTX_set_client_cert_cb(context.get(), RecordRequest);
  SSL_CTX_set_info_callback(context.get(), RecordAlert);
  return context;
}

bool IsAddress(const std::string& name) {
  std::array<unsigned char, sizeof(in6_addr)> octets{};
  const std::string withoutZone = name.substr(0, name.find('%'));
  return inet_pton(AF_INET, name.c_str(), octets.data()) == 1 ||
         inet_pton(AF_INET6, withoutZone.c_str(), octets.data()) == 1;
}

// A handshake over memory, so that each wait for the socket has a limit.
class Handshake {
 public:
  Handshake(SSL_CTX* context, const std::string& serverName, TlsAttempt& attempt)
      : ssl_(SSL_new(context)), attempt_(attempt) {
    Require(ssl_ != nullptr);
    BIO* const input = BIO_new(BIO_s_mem());
    BIO* const output = BIO_new(BIO_s_mem());
    SSL_set_bio(ssl_.get(), input, output);
    Require(input != nullptr && output != nullptr && SSL_set_app_data(ssl_.get(), &attempt) == 1);
    if (!IsAddress(serverName)) {
      // The expansion of SSL_set_tlsext_host_name, without its C-style cast.
      Require(SSL_ctrl(ssl_.get(), SSL_CTRL_SET_TLSEXT_HOSTNAME, TLSEXT_NAMETYPE_host_name,
                       const_cast<char*>(serverName.c_str())) == 1);
    }
    SSL_set_connect_state(ssl_.get());
  }

  void Run(int socket, Clock::time_point end) {
    for (;;) {
      ERR_clear_error();
      const int result = SSL_do_handshake(ssl_.get());
      const int reason = SSL_get_error(ssl_.get(), result);
      Flush(socket, end);
      if (result == 1) {
        Finish();
        return;
      }
      if (reason != SSL_ERROR_WANT_READ) {
        attempt_.error = ErrorText();
        return;
      }
      if (!Fill(socket, end)) {
        return;
      }
    }
  }

 private:
  // A peer that does not take it may have sent the reason, which is read in any case.
  void Flush(int socket, Clock::time_point end) {
    char* octets = nullptr;
    const long size = BIO_get_mem_data(SSL_get_wbio(ssl_.get()), &octets);
    const std::string text(octets, static_cast<std::size_t>(std::max(size, 0L)));
    static_cast<void>(BIO_reset(SSL_get_wbio(ssl_.get())));
    SendAll(socket, text, end);
  }

  bool Fill(int socket, Clock::time_point end) {
    std::string octets;
    const Reading reading = ReadSome(socket, end, octets);
    attempt_.isTimedOut = reading == Reading::kTimedOut;
    attempt_.isClosed = reading == Reading::kEnd || reading == Reading::kFailed;
    if (reading != Reading::kOctets) {
      return false;
    }
    attempt_.firstOctets += octets;
    attempt_.firstOctets.resize(std::min(attempt_.firstOctets.size(), kFirstOctets));
    received_ += octets.size();
    if (received_ > kMaxOctets) {
      attempt_.error = "it sends more than a handshake has";
      return false;
    }
    const int size = static_cast<int>(octets.size());
    return BIO_write(SSL_get_rbio(ssl_.get()), octets.data(), size) == size;
  }

  void Finish() {
    attempt_.isDone = true;
    attempt_.protocol = SSL_get_version(ssl_.get());
    attempt_.cipher = SSL_get_cipher_name(ssl_.get());
    STACK_OF(X509)* const chain = SSL_get_peer_cert_chain(ssl_.get());
    for (int i = 0; i < sk_X509_num(chain); ++i) {
      X509* const certificate = sk_X509_value(chain, i);
      X509_up_ref(certificate);
      attempt_.chain.emplace_back(certificate);
    }
  }

  static std::string ErrorText() {
    const char* reason = ERR_reason_error_string(ERR_peek_last_error());
    return reason != nullptr ? reason : "no reason given";
  }

  OwnedSsl ssl_;
  TlsAttempt& attempt_;
  std::size_t received_ = 0;
};

}  // namespace

TlsAttempt TryTls(const Address& address, const std::string& serverName, TlsOffer offer,
                  Clock::time_point end) {
  TlsAttempt attempt;
  const std::vector<TcpAttempt> connections = ConnectToAll({address}, end);
  attempt.isConnected = connections.front().error == 0;
  if (!attempt.isConnected) {
    attempt.isTimedOut = Clock::now() >= end;
    return attempt;
  }
  const OwnedContext context = MakeContext(offer);
  Handshake(context.get(), serverName, attempt).Run(connections.front().socket.Get(), end);
  return attempt;
}

std::string TryPlainHttp(const Address& address, const std::string& host, Clock::time_point end) {
  const std::vector<TcpAttempt> connections = ConnectToAll({address}, end);
  const int socket = connections.front().socket.Get();
  const std::string request = "HEAD / HTTP/1.1\r\nHost: " + host + "\r\nConnection: close\r\n\r\n";
  std::string answer;
  if (connections.front().error == 0 && SendAll(socket, request, end)) {
    ReadSome(socket, end, answer);
  }
  return answer;
}

bool IsHttp(const std::string& octets) {
  return octets.rfind("HTTP/", 0) == 0;
}

bool IsTlsRecord(const std::string& octets) {
  constexpr char kAlert = 21;
  constexpr char kHandshake = 22;
  return octets.size() >= 3 && (octets[0] == kAlert || octets[0] == kHandshake) && octets[1] == 3 &&
         octets[2] >= 0 && octets[2] <= 4;
}

}  // namespace SsoClient::Tool::Doctor
