#include "gate/shown_text.h"

#include <tarnik/core/exception.h>
#include <tarnik/text/display_text.h>

#include "certificate_text.h"

namespace SsoClient::Access {

namespace {

constexpr std::size_t kMaxShown = 120;

std::string FingerprintOf(const Tarnik::Crypto::Certificate& certificate) {
  try {
    return ShortFingerprint(certificate);
  } catch (const Tarnik::Exception&) {
    return "unknown";
  }
}

}  // namespace

std::string ShownText(std::string_view text) {
  return "'" + Tarnik::ToDisplayText(text, kMaxShown) + "'";
}

std::string ShownName(const PrincipalId& principal) {
  return ShownText(principal.name + "@" + principal.domain);
}

std::string ShownCertificate(const Tarnik::Crypto::Certificate& certificate) {
  return ShownText(certificate.SubjectName()) + " (SHA-256 " + FingerprintOf(certificate) + ")";
}

std::string ShownDuration(std::chrono::seconds duration) {
  return std::to_string(duration.count()) + " s";
}

}  // namespace SsoClient::Access
