#include <algorithm>
#include <mutex>
#include <optional>
#include <utility>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/http/cookie_store.h>
#include <tarnik/text/string_util.h>

#include "http/set_cookie.h"
#include "support/object_lock.h"
#include "system/host_name.h"

namespace Tarnik::Http {
namespace {

constexpr std::size_t kMaxCookiesPerHost = 50;
constexpr std::size_t kMaxCookies = 300;

struct Cookie {
  SetCookie given;
  /// Sent only to `given.domain`, not to its subdomains.
  bool isHostOnly;
};

/// With or without the full stop of the DNS root, a name means the same host.
std::string CanonicalHost(std::string_view host) {
  return StringUtil::ToLower(System::WithoutRootDot(host));
}

/// RFC 6265, section 5.1.3; both in lower case.
bool DomainMatches(std::string_view host, std::string_view domain) {
  if (host == domain) {
    return true;
  }
  if (host.size() <= domain.size() || !host.ends_with(domain)) {
    return false;
  }
  return host[host.size() - domain.size() - 1] == '.' && System::IsDnsName(host);
}

/// RFC 6265, section 5.1.4.
bool PathMatches(std::string_view requestPath, std::string_view cookiePath) {
  if (!requestPath.starts_with(cookiePath)) {
    return false;
  }
  return requestPath.size() == cookiePath.size() || cookiePath.back() == '/' ||
         requestPath[cookiePath.size()] == '/';
}

std::string_view WithoutQuery(std::string_view path) {
  return path.substr(0, path.find('?'));
}

/// RFC 6265, section 5.1.4.
std::string DefaultPath(std::string_view requestPath) {
  if (requestPath.empty() || requestPath.front() != '/') {
    return "/";
  }
  const auto lastSlash = requestPath.rfind('/');
  return lastSlash == 0 ? "/" : std::string(requestPath.substr(0, lastSlash));
}

bool IsSameCookie(const Cookie& a, const Cookie& b) {
  return a.given.name == b.given.name && a.given.domain == b.given.domain &&
         a.given.path == b.given.path;
}

bool IsExpired(const Cookie& cookie, const System::DateTime& now) {
  return cookie.given.expiry && *cookie.given.expiry <= now;
}

class CookieStoreImpl final : public CookieStore, public ObjectImpl {
 public:
  explicit CookieStoreImpl(std::string name) : name_(std::move(name)) {}
  ~CookieStoreImpl() override {
    for (Cookie& cookie : cookies_) {
      StringUtil::Cleanse(cookie.given.value);
    }
  }

  std::string ToString() const override { return "<CookieStore:" + name_ + ">"; }

  void Store(std::string_view host, std::string_view path, bool isSecure,
             std::string_view setCookie, const System::DateTime& now) override {
    std::optional<Cookie> cookie = Accept(host, path, isSecure, setCookie, now);
    if (!cookie) {
      return;
    }
    const std::lock_guard guard(ObjectLock(this));
    DropExpired(now);
    const auto old = std::find_if(cookies_.begin(), cookies_.end(),
                                  [&](const Cookie& each) { return IsSameCookie(each, *cookie); });
    if (old == cookies_.end()) {
      Add(std::move(*cookie), now);
      return;
    }
    // A peer on plain HTTP is not authenticated, so it must not replace a Secure cookie.
    if (old->given.isSecure && !isSecure) {
      return;
    }
    if (IsExpired(*cookie, now)) {
      cookies_.erase(old);
      return;
    }
    // RFC 6265, section 5.3, step 11: the creation time, here the position, is kept.
    *old = std::move(*cookie);
  }

  std::string HeaderFor(std::string_view host, std::string_view path, bool isSecure,
                        const System::DateTime& now) override {
    const std::string lowerHost = CanonicalHost(host);
    const std::string_view requestPath = WithoutQuery(path);
    const std::lock_guard guard(ObjectLock(this));
    DropExpired(now);
    std::vector<const Cookie*> matches;
    for (const Cookie& cookie : cookies_) {
      if (AppliesTo(cookie, lowerHost, requestPath, isSecure)) {
        matches.push_back(&cookie);
      }
    }
    // RFC 6265, section 5.4, step 2: longer paths first, then the older ones.
    std::stable_sort(matches.begin(), matches.end(), [](const Cookie* a, const Cookie* b) {
      return a->given.path.size() > b->given.path.size();
    });
    return Join(matches);
  }

 private:
  /// The cookie to store; nothing when RFC 6265, section 5.3 says to ignore it.
  static std::optional<Cookie> Accept(std::string_view host, std::string_view path, bool isSecure,
                                      std::string_view setCookie, const System::DateTime& now) {
    std::optional<SetCookie> given = ParseSetCookie(setCookie, now);
    if (!given || (given->isSecure && !isSecure)) {
      return std::nullopt;
    }
    const std::string lowerHost = CanonicalHost(host);
    const bool isHostOnly = given->domain.empty() || given->domain == lowerHost;
    if (!isHostOnly && !IsAllowedDomain(lowerHost, given->domain)) {
      return std::nullopt;
    }
    if (given->domain.empty()) {
      given->domain = lowerHost;
    }
    if (given->path.empty()) {
      given->path = DefaultPath(WithoutQuery(path));
    }
    return Cookie{std::move(*given), isHostOnly};
  }

  // RFC 6265, section 5.3, step 5: no cookie for a public suffix. Without a list of these, only a
  // domain of one label is recognised as one.
  static bool IsAllowedDomain(std::string_view host, std::string_view domain) {
    return domain.find('.') != std::string_view::npos && DomainMatches(host, domain);
  }

  static bool AppliesTo(const Cookie& cookie, std::string_view host, std::string_view path,
                        bool isSecure) {
    if (cookie.given.isSecure && !isSecure) {
      return false;
    }
    if (!PathMatches(path, cookie.given.path)) {
      return false;
    }
    return cookie.isHostOnly ? host == cookie.given.domain
                             : DomainMatches(host, cookie.given.domain);
  }

  static std::string Join(const std::vector<const Cookie*>& cookies) {
    std::string header;
    for (const Cookie* cookie : cookies) {
      header.append(header.empty() ? "" : "; ").append(cookie->given.name);
      header.append("=").append(cookie->given.value);
    }
    return header;
  }

  void DropExpired(const System::DateTime& now) {
    std::erase_if(cookies_, [&](const Cookie& cookie) { return IsExpired(cookie, now); });
  }

  void Add(Cookie cookie, const System::DateTime& now) {
    if (IsExpired(cookie, now)) {
      return;
    }
    const auto hasSameDomain = [&](const Cookie& each) {
      return each.given.domain == cookie.given.domain;
    };
    if (static_cast<std::size_t>(std::count_if(cookies_.begin(), cookies_.end(), hasSameDomain)) ==
        kMaxCookiesPerHost) {
      cookies_.erase(std::find_if(cookies_.begin(), cookies_.end(), hasSameDomain));
    }
    if (cookies_.size() == kMaxCookies) {
      cookies_.erase(cookies_.begin());
    }
    cookies_.push_back(std::move(cookie));
  }

  const std::string name_;
  std::vector<Cookie> cookies_;  // the oldest first
};

}  // namespace

Ref<CookieStore> CreateCookieStore(const std::string& name) {
  return MakeRef<CookieStoreImpl>(name);
}

}  // namespace Tarnik::Http
