#ifndef SSOCLIENT_TOOL_DOCTOR_FINDING_NAME_H
#define SSOCLIENT_TOOL_DOCTOR_FINDING_NAME_H

#include <algorithm>
#include <array>
#include <stdexcept>
#include <string_view>

namespace SsoClient::Tool::Doctor {

/// The names of all problems, by the step that finds them.
inline constexpr auto kFindingNames = std::to_array<std::string_view>({
    // options
    "bad-url",
    "http-url",
    "http-with-https-port",
    "https-with-http-port",
    // trust
    "file-missing",
    "file-unreadable",
    "bad-ca-file",
    "bad-revocation-list",
    "bad-sts-certificate",
    "trust-unusable",
    "local-certificate-expired",
    "local-certificate-not-yet-valid",
    "local-certificate-expires-soon",
    // credentials
    "bad-certificate-file",
    "bad-key-file",
    "no-key",
    "no-passphrase",
    "passphrase-file",
    "passphrase-file-open",
    "key-mismatch",
    "key-file-open",
    "keytab-file-open",
    // dns
    "unknown-host",
    "no-name-server",
    "dns-timed-out",
    // tcp
    "refused",
    "tcp-timed-out",
    "network-unreachable",
    "host-unreachable",
    "tcp-failed",
    "only-ipv6",
    "some-addresses-fail",
    // tls
    "http-on-https-port",
    "not-tls",
    "tls-timed-out",
    "tls-closed",
    "tls-no-connection",
    "tls-too-old",
    "tls-weak-ciphers",
    "client-certificate-required",
    "tls-refused",
    // certificate
    "wrong-name",
    "unknown-ca",
    "unknown-issuer",
    "ca-replaced",
    "self-signed",
    "expired",
    "not-yet-valid",
    "expires-soon",
    "revoked",
    "revocation-unknown",
    "not-trusted",
    "verdicts-differ",
    "library-cannot-connect",
    // http
    "wrong-path",
    "html-page",
    "redirect",
    "http-unauthorized",
    "http-forbidden",
    "proxy-authentication",
    "http-server-error",
    "http-status",
    "https-on-http-port",
    "not-http",
    "http-cut-off",
    "http-timed-out",
    "http-failed",
    "tls-broken",
    // clock
    "clock-off",
    "clock-far-off",
    // sts
    "not-an-sts",
    "sts-uncertain",
    // login
    "login-refused",
    "password-expired",
    "no-password",
    "password-file",
    "password-file-open",
    "login-fault",
    "login-unanswered",
    "login-failed",
    "signer-mismatch",
    "signature-not-verified",
    "token-rejected",
    "kerberos-failed",
    "bad-service",
    "plain-http",
    // token
    "token-not-yet-valid",
    "token-already-expired",
    // any
    "out-of-time",
    "local-failure",
});

/// One of `kFindingNames`.
class FindingName {
 public:
  /// Does not compile for another name.
  consteval FindingName(const char* name) : text_(name) {
    if (!IsKnown(name)) {
      throw std::invalid_argument("not in kFindingNames");
    }
  }

  /// `other` if no listed name is equal to it.
  static FindingName FindOr(std::string_view name, FindingName other) {
    const auto* const found = std::find(kFindingNames.begin(), kFindingNames.end(), name);
    return found != kFindingNames.end() ? FindingName(*found) : other;
  }

  constexpr std::string_view Text() const noexcept { return text_; }

 private:
  constexpr explicit FindingName(std::string_view known) noexcept : text_(known) {}

  static constexpr bool IsKnown(std::string_view name) {
    return std::find(kFindingNames.begin(), kFindingNames.end(), name) != kFindingNames.end();
  }

  std::string_view text_;
};

}  // namespace SsoClient::Tool::Doctor

#endif
