#ifndef SSOCLIENT_TOOL_FAILURE_KINDS_H
#define SSOCLIENT_TOOL_FAILURE_KINDS_H

#include <algorithm>
#include <array>
#include <string>
#include <string_view>

namespace SsoClient::Tool {

/// All kinds of failures, sorted. Programs depend on them, and docs/tool.md describes each.
inline constexpr std::array<std::string_view, 54> kFailureKinds{
    "abandoned",
    "bad-answer",
    "bad-service",
    "bad-token",
    "bad-url",
    "bearer-by-key",
    "cut-off",
    "expired-password",
    "fault",
    "http-status",
    "kerberos",
    "key",
    "key-file",
    "key-file-open",
    "key-mismatch",
    "keytab-file",
    "keytab-file-open",
    "local",
    "no-kerberos",
    "no-key",
    "no-login",
    "no-passphrase",
    "no-password",
    "no-sts-certificate",
    "no-trust",
    "no-user",
    "not-a-token",
    "not-bound",
    "output-file",
    "output-json",
    "output-terminal",
    "passphrase-fd",
    "passphrase-file",
    "passphrase-file-open",
    "passphrase-long",
    "password-fd",
    "password-file",
    "password-file-open",
    "password-long",
    "plain-http",
    "proof-file",
    "refused-login",
    "sts-certificate",
    "terminal",
    "timed-out",
    "tls",
    "tls-files",
    "tls-name",
    "tls-trust",
    "token-file",
    "token-file-open",
    "trust-files",
    "unreachable",
    "usage",
};

/// One of `kFailureKinds`.
class KindName {
 public:
  /// Of a literal; one that is not listed does not compile.
  consteval KindName(const char* name) : name_(name) {
    if (!IsListed(name)) {
      throw "the kind is not listed";
    }
  }
  /// The listed name that is equal to this one. Throws `std::logic_error` if it is not
  /// listed.
  static KindName Find(std::string_view name);

  std::string Text() const { return std::string(name_); }

 private:
  struct Listed {};
  KindName(std::string_view name, Listed /*tag*/) : name_(name) {}
  static constexpr bool IsListed(std::string_view name) {
    return std::binary_search(kFailureKinds.begin(), kFailureKinds.end(), name);
  }

  std::string_view name_;
};

}  // namespace SsoClient::Tool

#endif
