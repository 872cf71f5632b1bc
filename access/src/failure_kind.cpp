#include <ssoclient/access/failure_kind.h>
#include <ssoclient/exceptions.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/http/http_exception.h>
#include <tarnik/ssl/ssl_exception.h>
#include <tarnik/xml/security/xml_security_exception.h>
#include <tarnik/xml/xml_parse_exception.h>

namespace SsoClient::Access {

namespace {

template <class Class>
bool Is(const Tarnik::Exception& failure) noexcept {
  return dynamic_cast<const Class*>(&failure) != nullptr;
}

FailureKind ClassifyClient(const SsoException& failure) noexcept {
  if (Is<InvalidCredentialsException>(failure)) {
    return FailureKind::kRefusedLogin;
  }
  if (Is<PasswordExpiredException>(failure)) {
    return FailureKind::kExpiredPassword;
  }
  if (Is<CommunicationException>(failure)) {
    return FailureKind::kUnreachable;
  }
  return Is<InvalidTokenException>(failure) ? FailureKind::kBadToken : FailureKind::kFault;
}

FailureKind ClassifyTls(const Tarnik::IOException& failure) noexcept {
  if (Is<Tarnik::Ssl::PeerTrustException>(failure)) {
    return FailureKind::kTlsTrust;
  }
  if (Is<Tarnik::Ssl::PeerNameException>(failure)) {
    return FailureKind::kTlsName;
  }
  return Is<Tarnik::Ssl::TruncationException>(failure) ? FailureKind::kCutOff : FailureKind::kTls;
}

FailureKind ClassifyExchange(const Tarnik::IOException& failure) noexcept {
  if (Is<Tarnik::TimeoutException>(failure)) {
    return FailureKind::kTimedOut;
  }
  if (Is<Tarnik::CancelledException>(failure)) {
    return FailureKind::kAbandoned;
  }
  if (Is<Tarnik::Ssl::SSLException>(failure)) {
    return ClassifyTls(failure);
  }
  if (Is<Tarnik::Http::CutOffException>(failure)) {
    return FailureKind::kCutOff;
  }
  return Is<Tarnik::Http::HttpException>(failure) ? FailureKind::kBadAnswer
                                                  : FailureKind::kUnreachable;
}

}  // namespace

const char* NameOf(FailureKind kind) noexcept {
  switch (kind) {
    case FailureKind::kNone:
      return "none";
    case FailureKind::kUnreachable:
      return "unreachable";
    case FailureKind::kTlsTrust:
      return "tls-trust";
    case FailureKind::kTlsName:
      return "tls-name";
    case FailureKind::kTls:
      return "tls";
    case FailureKind::kTimedOut:
      return "timed-out";
    case FailureKind::kCutOff:
      return "cut-off";
    case FailureKind::kHttpStatus:
      return "http-status";
    case FailureKind::kBadAnswer:
      return "bad-answer";
    case FailureKind::kFault:
      return "fault";
    case FailureKind::kRefusedLogin:
      return "refused-login";
    case FailureKind::kExpiredPassword:
      return "expired-password";
    case FailureKind::kBadToken:
      return "bad-token";
    case FailureKind::kSecretFailed:
      return "secret-failed";
    case FailureKind::kAbandoned:
      return "abandoned";
    case FailureKind::kLocal:
      return "local";
  }
  return "unknown";
}

FailureKind Classify(const Tarnik::Exception& failure) noexcept {
  if (const auto* client = dynamic_cast<const SsoException*>(&failure)) {
    return ClassifyClient(*client);
  }
  if (const auto* exchange = dynamic_cast<const Tarnik::IOException*>(&failure)) {
    return ClassifyExchange(*exchange);
  }
  const bool isToken = Is<Tarnik::Xml::XMLParseException>(failure) ||
                       Is<Tarnik::Base64FormatException>(failure) ||
                       Is<Tarnik::Crypto::CryptoException>(failure) ||
                       Is<Tarnik::Xml::Security::XmlSecurityException>(failure);
  return isToken ? FailureKind::kBadToken : FailureKind::kLocal;
}

bool AllowsFailover(FailureKind kind) noexcept {
  switch (kind) {
    case FailureKind::kUnreachable:
    case FailureKind::kTlsTrust:
    case FailureKind::kTlsName:
    case FailureKind::kTls:
    case FailureKind::kTimedOut:
    case FailureKind::kCutOff:
    case FailureKind::kHttpStatus:
      return true;
    default:
      return false;
  }
}

}  // namespace SsoClient::Access
