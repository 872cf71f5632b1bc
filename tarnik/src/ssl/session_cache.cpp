#include "ssl/session_cache.h"

#include <algorithm>
#include <iterator>
#include <mutex>
#include <utility>

#include "support/object_lock.h"

namespace Tarnik::Ssl {
namespace {

bool IsPeerCertificateCurrent(const SSL_SESSION* session) {
  // OpenSSL's accessor lacks the const but does not modify the session.
  const X509* certificate = SSL_SESSION_get0_peer(const_cast<SSL_SESSION*>(session));
  return certificate != nullptr && X509_cmp_current_time(X509_get0_notAfter(certificate)) > 0;
}

}  // namespace

void SessionCache::Put(const std::string& peer, OpenSsl::OwnedSslSession session,
                       Clock::time_point now) {
  if (SSL_SESSION_is_resumable(session.get()) == 0) {
    return;
  }
  const OpenSsl::Section section;  // sessions are freed with the lock held
  const std::lock_guard lock(ObjectLock(this));
  ForgetParent();
  entries_.push_front({peer, std::move(session), now});
  std::size_t ofPeer = 0;
  for (auto entry = entries_.begin(); entry != entries_.end();) {
    const bool isSurplus = entry->peer == peer && ++ofPeer > kMaxSessionsOfPeer;
    entry = isSurplus ? entries_.erase(entry) : std::next(entry);
  }
  if (entries_.size() > kMaxSessions) {
    entries_.pop_back();
  }
}

OpenSsl::OwnedSslSession SessionCache::Take(const std::string& peer, Clock::time_point now) {
  const OpenSsl::Section section;  // sessions are freed with the lock held
  const std::lock_guard lock(ObjectLock(this));
  ForgetParent();
  entries_.remove_if([now](const Entry& entry) {
    return now - entry.made >= kMaxAge || !IsPeerCertificateCurrent(entry.session.get());
  });
  const auto found = std::find_if(entries_.begin(), entries_.end(),
                                  [&peer](const Entry& entry) { return entry.peer == peer; });
  if (found == entries_.end()) {
    return nullptr;
  }
  if (SSL_SESSION_get_protocol_version(found->session.get()) < TLS1_3_VERSION) {
    // A copy, since connections modify the session that they use.
    return OpenSsl::OwnedSslSession(SSL_SESSION_dup(found->session.get()));
  }
  OpenSsl::OwnedSslSession session = std::move(found->session);
  entries_.erase(found);
  return session;
}

void SessionCache::ForgetParent() {
  if (mark_.IsFromParent()) {
    mark_ = ForkMark();
    entries_.clear();
  }
}

std::size_t SessionCache::Size() const {
  const std::lock_guard lock(ObjectLock(this));
  return entries_.size();
}

}  // namespace Tarnik::Ssl
