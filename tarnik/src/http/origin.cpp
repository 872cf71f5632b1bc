#include "http/origin.h"

#include <utility>

#include <tarnik/system/date_time.h>

#include "support/ascii.h"
#include "system/host_name.h"

namespace Tarnik::Http {
namespace {

std::string CookiePathOf(const std::string& target) {
  if (target.front() == '/') {
    return target;
  }
  const auto authority = target.find("://");
  const auto path = authority == std::string::npos ? authority : target.find('/', authority + 3);
  return path == std::string::npos ? "/" : target.substr(path);
}

}  // namespace

Origin::Origin(Parts parts) : parts_(std::move(parts)), cookiePath_(CookiePathOf(parts_.target)) {}

RequestRoute Origin::Route(bool isSecure) const {
  RequestRoute route;
  route.hostField = HostField(isSecure);
  if (parts_.isProxy) {
    route.targetPrefix = (isSecure ? "https://" : "http://") + route.hostField;
  }
  if (parts_.cookies != nullptr) {
    route.cookies = parts_.cookies->HeaderFor(parts_.cookieHost, cookiePath_, isSecure,
                                              System::GetUtcDateTime());
  }
  return route;
}

// RFC 9110, section 7.2: the host and, unless it is the scheme's own, the port.
std::string Origin::HostField(bool isSecure) const {
  std::string host = System::BracketIPv6(parts_.host);
  const std::string& key = parts_.endpointKey;
  const auto colon = key.rfind(':');
  const std::string port = colon == std::string::npos ? std::string() : key.substr(colon + 1);
  if (!AreDigits(port) || port == (isSecure ? "443" : "80")) {
    return host;
  }
  return host + ":" + port;
}

void Origin::StoreCookies(const ClientResponseImpl& response, bool isSecure) const {
  if (parts_.cookies == nullptr) {
    return;
  }
  const System::DateTime now = System::GetUtcDateTime();
  for (const auto& [name, value] : response.Headers()) {
    if (EqualsIgnoringCase(name, "Set-Cookie")) {
      parts_.cookies->Store(parts_.cookieHost, cookiePath_, isSecure, value, now);
    }
  }
}

}  // namespace Tarnik::Http
