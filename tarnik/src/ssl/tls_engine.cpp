#include "ssl/tls_engine.h"

#include <algorithm>
#include <climits>
#include <utility>

#include <openssl/err.h>

#include <tarnik/text/string_util.h>

#include "ssl/tls_error_text.h"
#include "support/openssl_error.h"
#include "support/openssl_section.h"

namespace Tarnik::Ssl {
namespace {

int ToInt(std::size_t size) {
  return static_cast<int>(std::min(size, static_cast<std::size_t>(INT_MAX)));
}

// The earliest error is the cause of the later ones.
std::string TakeReason() {
  std::string text = TlsErrorText(ERR_peek_error());
  ERR_clear_error();
  return text;
}

constexpr std::size_t kRecordHeaderSize = 5;

// A record of a content type that a handshake may start with, of any version (RFC 8446, section
// 5.1).
bool StartsLikeTls(const std::string& bytes) {
  constexpr char kAlert = 21;
  constexpr char kHandshake = 22;
  constexpr char kMajorVersion = 3;
  return bytes.empty() || ((bytes[0] == kAlert || bytes[0] == kHandshake) &&
                           (bytes.size() < 2 || bytes[1] == kMajorVersion));
}

TlsEngine* EngineOf(const SSL* ssl) {
  return static_cast<TlsEngine*>(SSL_get_app_data(ssl));
}

}  // namespace

TlsEngine::TlsEngine(Ref<SSLContextImpl> context, const std::string& host,
                     const std::string& serverName, const std::string& peer)
    : context_(std::move(context)),
      peer_(peer),
      sessionPeer_(StringUtil::ToLower(host) + '\n' + StringUtil::ToLower(serverName)),
      check_(host, serverName, context_->Pinned()) {
  const OpenSsl::ErrorScope errors;
  ssl_.reset(SSL_new(context_->Get()));
  OpenSsl::OwnedBio input(BIO_new(BIO_s_mem()));
  OpenSsl::OwnedBio output(BIO_new(BIO_s_mem()));
  if (ssl_ == nullptr || input == nullptr || output == nullptr ||
      SSL_set_app_data(ssl_.get(), this) != 1) {
    throw SSLException(errors.Describe("Cannot set up TLS for " + peer_));
  }
  input_ = input.get();
  output_ = output.get();
  SSL_set0_rbio(ssl_.get(), input.release());
  SSL_set0_wbio(ssl_.get(), output.release());
  SSL_set_connect_state(ssl_.get());
  check_.ApplyTo(ssl_.get());
  Resume();
}

TlsEngine::~TlsEngine() {
  if (isHandshakeDone_ && !hasFailed_) {
    // OpenSSL does not resume the session of a connection that was not shut down. This one did not
    // fail; it was only closed without close_notify.
    SSL_set_shutdown(ssl_.get(), SSL_SENT_SHUTDOWN | SSL_RECEIVED_SHUTDOWN);
  }
}

void TlsEngine::Resume() {
  const auto session = context_->Sessions().Take(sessionPeer_, SessionCache::Clock::now());
  if (session != nullptr) {
    SSL_set_session(ssl_.get(), session.get());
  }
}

bool TlsEngine::Handshake() {
  const OpenSsl::Section section;
  ERR_clear_error();
  const int result = SSL_do_handshake(ssl_.get());
  if (result == 1) {
    if (!check_.IsAccepted(ssl_.get())) {
      Fail("");
    }
    isHandshakeDone_ = true;
    return true;
  }
  if (SSL_get_error(ssl_.get(), result) == SSL_ERROR_WANT_READ) {
    return false;
  }
  Fail("");
}

std::optional<std::size_t> TlsEngine::Read(char* buffer, std::size_t size) {
  const OpenSsl::Section section;
  ERR_clear_error();
  const int result = SSL_read(ssl_.get(), buffer, ToInt(size));
  if (result > 0) {
    return static_cast<std::size_t>(result);
  }
  switch (SSL_get_error(ssl_.get(), result)) {
    case SSL_ERROR_WANT_READ:
      return std::nullopt;
    case SSL_ERROR_ZERO_RETURN:
      return 0;
    default:
      Fail("Cannot read from");
  }
}

std::size_t TlsEngine::Write(const char* data, std::size_t size) {
  const OpenSsl::Section section;
  ERR_clear_error();
  const int result = SSL_write(ssl_.get(), data, ToInt(size));
  if (result <= 0) {
    Fail("Cannot write to");
  }
  return static_cast<std::size_t>(result);
}

// OpenSSL's words for an answer that is not TLS differ between releases and between first bytes.
void TlsEngine::ExamineStart(const char* data, std::size_t size) {
  if (start_.size() == kRecordHeaderSize) {
    return;
  }
  start_.append(data, std::min(size, kRecordHeaderSize - start_.size()));
  if (start_ == "HTTP/") {
    notTls_ = "the peer answers in plain HTTP";
  } else if (!StartsLikeTls(start_)) {
    notTls_ = "the peer does not answer in TLS";
  }
}

void TlsEngine::Feed(const char* data, std::size_t size) {
  ExamineStart(data, size);
  if (BIO_write(input_, data, ToInt(size)) != ToInt(size)) {
    Fail("Cannot take in data from");
  }
}

std::size_t TlsEngine::OutputSize() const {
  return BIO_ctrl_pending(output_);
}

void TlsEngine::TakeOutput(std::vector<char>& taken) {
  taken.resize(OutputSize());
  const int size = taken.empty() ? 0 : BIO_read(output_, taken.data(), ToInt(taken.size()));
  taken.resize(static_cast<std::size_t>(std::max(size, 0)));
}

void TlsEngine::FailAtEndOfInput() const {
  if (!isHandshakeDone_) {
    throw HandshakeError(notTls_ == nullptr ? "the peer closed the connection" : notTls_);
  }
  throw TruncationException("The TLS connection with " + peer_ +
                            " was closed without close_notify: the data may be cut off.");
}

SSLException TlsEngine::HandshakeError(const std::string& cause) const {
  return SSLException(DescribeHandshake(cause));
}

std::string TlsEngine::DescribeHandshake(const std::string& cause) const {
  return "TLS handshake with " + peer_ + " failed: " + cause;
}

void TlsEngine::Fail(const std::string& operation) {
  hasFailed_ = true;
  const std::string reason = TakeReason();
  if (!isHandshakeDone_ && notTls_ != nullptr) {
    throw HandshakeError(notTls_);
  }
  if (!isHandshakeDone_) {
    FailHandshake(reason);
  }
  throw SSLException(operation + " the TLS connection with " + peer_ + ": " + reason);
}

void TlsEngine::FailHandshake(const std::string& reason) const {
  if (check_.Failure().empty()) {
    throw HandshakeError(reason);
  }
  if (check_.IsOtherPeer()) {
    throw PeerNameException(DescribeHandshake(check_.Failure()));
  }
  throw PeerTrustException(DescribeHandshake(check_.Failure()));
}

void TlsEngine::InstallCallbacks(SSL_CTX* context) {
  SSL_CTX_set_verify(context, SSL_VERIFY_PEER, &TlsEngine::OnVerified);
  SSL_CTX_set_session_cache_mode(context, SSL_SESS_CACHE_CLIENT | SSL_SESS_CACHE_NO_INTERNAL);
  SSL_CTX_sess_set_new_cb(context, &TlsEngine::OnNewSession);
}

int TlsEngine::OnVerified(int isValid, X509_STORE_CTX* context) {
  const auto* ssl = static_cast<const SSL*>(
      X509_STORE_CTX_get_ex_data(context, SSL_get_ex_data_X509_STORE_CTX_idx()));
  try {
    return EngineOf(ssl)->check_.OnVerified(isValid == 1, context) ? 1 : 0;
  } catch (...) {
    return 0;  // no exception may pass through OpenSSL
  }
}

int TlsEngine::OnNewSession(SSL* ssl, SSL_SESSION* session) {
  // Owned from the start, so that it is freed when it cannot be kept.
  OpenSsl::OwnedSslSession owned(session);
  TlsEngine* engine = EngineOf(ssl);
  try {
    engine->context_->Sessions().Put(engine->sessionPeer_, std::move(owned),
                                     SessionCache::Clock::now());
  } catch (...) {
    return 1;  // no exception may pass through OpenSSL; the session is just not resumed
  }
  return 1;
}

}  // namespace Tarnik::Ssl
