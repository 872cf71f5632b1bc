#ifndef DEVSTS_OPERATIONS_NEGOTIATION_STORE_H
#define DEVSTS_OPERATIONS_NEGOTIATION_STORE_H

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <string>

#include "kerberos/negotiated_login.h"
#include "operations/operations.h"

namespace DevSts {

// A request for a token whose login is in progress.
struct PendingIssue {
  CheckedRequest request;  // owns the document that `issue` points into
  IssueRequest issue;
  NegotiatedLogin login;
};

// The negotiations in progress, by Context. Only one thread at a time works on each of them.
// Thread-safe.
class NegotiationStore {
 public:
  NegotiationStore(std::size_t limit, std::chrono::milliseconds maxAge)
      : limit_(limit), maxAge_(maxAge) {}

  // One thread's turn to work on a negotiation. The destructor forgets the negotiation unless
  // `Keep` was called.
  class Turn {
   public:
    ~Turn();
    Turn(Turn&& other) noexcept;
    Turn(const Turn&) = delete;
    Turn& operator=(const Turn&) = delete;

    PendingIssue& Pending() { return *pending_; }
    // The cookie that the client must send with the later legs.
    const std::string& Cookie() const { return cookie_; }
    // Ends the turn. The negotiation continues in this Context.
    void Keep(const std::string& context);

   private:
    friend class NegotiationStore;
    Turn(NegotiationStore& store, std::string context, std::uint64_t serial, std::string cookie,
         std::unique_ptr<PendingIssue> pending);

    NegotiationStore* store_;
    std::string context_;
    std::uint64_t serial_;
    std::string cookie_;
    std::unique_ptr<PendingIssue> pending_;
  };

  // Throws Fault if the Context is in use.
  Turn Begin(const std::string& context, PendingIssue pending);
  // Throws Fault if there is no such negotiation, if another thread works on it, or if the cookie
  // is wrong; the negotiation is then unchanged.
  Turn Resume(const std::string& context, const std::string& cookie);

  std::size_t Size() const;

 private:
  using Clock = std::chrono::steady_clock;

  struct Entry {
    std::uint64_t serial = 0;
    std::string cookie;
    Clock::time_point begun;
    std::unique_ptr<PendingIssue> pending;  // null during a turn
  };

  void ForgetOld();
  void ForgetOldest();
  void End(const std::string& context, std::uint64_t serial);

  const std::size_t limit_;
  const std::chrono::milliseconds maxAge_;
  mutable std::mutex mutex_;
  std::map<std::string, Entry> entries_;
  std::uint64_t lastSerial_ = 0;
};

}  // namespace DevSts

#endif
