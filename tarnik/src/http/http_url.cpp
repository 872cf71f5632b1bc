#include <algorithm>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/http/http_url.h>

#include "support/ascii.h"
#include "system/host_name.h"

namespace Tarnik::Http {
namespace {

constexpr int kHttpPort = 80;
constexpr int kHttpsPort = 443;
constexpr int kMaxPort = 65535;

[[noreturn]] void Refuse(const char* fault) {
  throw InvalidArgumentException(std::string("Malformed URL: ") + fault + ".");
}

void CheckBytes(std::string_view url) {
  for (const char c : url) {
    if (c == ' ') {
      Refuse("it holds a blank");
    }
    if (IsControl(c)) {
      Refuse("it holds a control character");
    }
    if (!IsAscii(c)) {
      Refuse("it holds a character outside ASCII");
    }
  }
  if (url.find('#') != std::string_view::npos) {
    Refuse("it has a fragment");
  }
}

bool TakePrefix(std::string_view& text, std::string_view prefix) {
  if (!EqualsIgnoringCase(text.substr(0, prefix.size()), prefix)) {
    return false;
  }
  text.remove_prefix(prefix.size());
  return true;
}

bool TakeScheme(std::string_view& url) {
  if (TakePrefix(url, "https://")) {
    return true;
  }
  if (TakePrefix(url, "http://")) {
    return false;
  }
  Refuse("it does not begin with http:// or https://");
}

// RFC 3986, section 3.2.2: only an IPv6 address may be in brackets. A zone (RFC 6874) is meaningful
// only on this machine, so it is rejected too.
std::string_view TakeBracketedHost(std::string_view& authority) {
  const auto end = authority.find(']');
  if (end == std::string_view::npos) {
    Refuse("the bracket before the host is not closed");
  }
  const std::string_view host = authority.substr(1, end - 1);
  if (!System::IsIPv6Address(host)) {
    Refuse("the host in brackets is not an IPv6 address");
  }
  authority.remove_prefix(end + 1);
  return host;
}

std::string_view TakeHost(std::string_view& authority) {
  if (!authority.empty() && authority.front() == '[') {
    return TakeBracketedHost(authority);
  }
  const std::string_view host = authority.substr(0, authority.find(':'));
  if (host.empty()) {
    Refuse("the host is missing");
  }
  if (!System::IsDnsName(host) && !System::IsIPv4Address(host)) {
    Refuse("the host is neither a name nor an address");
  }
  authority.remove_prefix(host.size());
  return host;
}

int ParsePort(std::string_view digits) {
  int port = 0;
  for (const char c : digits) {
    if (!IsDigit(c)) {
      Refuse("the port is not a number");
    }
    port = std::min(port * 10 + (c - '0'), kMaxPort + 1);
  }
  if (port == 0 || port > kMaxPort) {
    Refuse("the port is outside 1 to 65535");
  }
  return port;
}

int TakePort(std::string_view rest, int defaultPort) {
  if (rest.empty()) {
    return defaultPort;
  }
  if (rest.front() != ':') {
    Refuse("something other than a port follows the host");
  }
  rest.remove_prefix(1);
  // RFC 3986, section 3.2.3: an empty port means the default port of the scheme.
  return rest.empty() ? defaultPort : ParsePort(rest);
}

void CheckEscapes(std::string_view path) {
  for (auto percent = path.find('%'); percent != std::string_view::npos;
       percent = path.find('%', percent + 1)) {
    const std::string_view digits = path.substr(percent + 1, 2);
    if (digits.size() != 2 || !std::all_of(digits.begin(), digits.end(), IsHexDigit)) {
      Refuse("a percent sign is not followed by two hexadecimal digits");
    }
  }
}

void CheckPath(std::string_view path) {
  // RFC 3986, appendix A: printable ASCII that pchar, "/" and "?" do not include.
  if (path.find_first_of("\"<>[\\]^`{|}") != std::string_view::npos) {
    Refuse("the path or query holds a character that must be percent-encoded");
  }
  CheckEscapes(path);
}

}  // namespace

void ParseHttpURL(std::string_view url, bool& isHttps, std::string& host, int& port,
                  std::string& path) {
  CheckBytes(url);
  const bool secure = TakeScheme(url);
  const auto pathStart = std::min(url.find_first_of("/?"), url.size());
  std::string_view authority = url.substr(0, pathStart);
  const std::string_view target = url.substr(pathStart);
  if (authority.find('@') != std::string_view::npos) {
    Refuse("it holds user information");
  }
  const std::string_view parsedHost = TakeHost(authority);
  const int parsedPort = TakePort(authority, secure ? kHttpsPort : kHttpPort);
  CheckPath(target);

  std::string newHost(parsedHost);
  std::string newPath(target);
  if (newPath.empty() || newPath.front() == '?') {
    newPath.insert(newPath.begin(), '/');
  }
  isHttps = secure;
  host = std::move(newHost);
  port = parsedPort;
  path = std::move(newPath);
}

}  // namespace Tarnik::Http
