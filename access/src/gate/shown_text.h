#ifndef SSOCLIENT_ACCESS_GATE_SHOWN_TEXT_H
#define SSOCLIENT_ACCESS_GATE_SHOWN_TEXT_H

#include <chrono>
#include <cstddef>
#include <string>
#include <string_view>

#include <ssoclient/principal_id.h>
#include <tarnik/crypto/certificate.h>

namespace SsoClient::Access {

/// "'text'", without control characters, and cut when it is long.
std::string ShownText(std::string_view text);

/// "name@domain" in the same way.
std::string ShownName(const PrincipalId& principal);

/// "'CN=holder' (SHA-256 AB:CD:EF:01:23:45:67:89...)"
std::string ShownCertificate(const Tarnik::Crypto::Certificate& certificate);

/// "300 s"
std::string ShownDuration(std::chrono::seconds duration);

/// The first few elements, with commas, and how many more there are: "'a', 'b' and 7 more".
template <class List, class Show>
std::string ShownList(const List& list, const Show& show) {
  constexpr std::size_t kMostShown = 4;
  std::string text;
  std::size_t count = 0;
  for (const auto& element : list) {
    if (count++ < kMostShown) {
      text.append(text.empty() ? "" : ", ").append(show(element));
    }
  }
  if (count > kMostShown) {
    text.append(" and ").append(std::to_string(count - kMostShown)).append(" more");
  }
  return text;
}

}  // namespace SsoClient::Access

#endif
