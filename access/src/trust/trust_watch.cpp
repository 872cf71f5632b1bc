#include "trust/trust_watch.h"

#include <algorithm>
#include <new>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/system/thread_pool.h>

namespace SsoClient::Access {

namespace {

std::size_t CountMissing(const Trust& trust, const Trust& other) {
  return static_cast<std::size_t>(
      std::count_if(trust.identities.begin(), trust.identities.end(),
                    [&other](const auto& signer) { return !other.identities.contains(signer); }));
}

TrustRecord RecordOf(const TrustStoreConfig& config, const Trust& trust) {
  TrustRecord record;
  record.store = config.name;
  record.issuersWithoutSigners = trust.issuersWithoutSigners;
  record.signers = trust.signers.size();
  for (const TrustedSigner& signer : trust.signers) {
    record.revoked += signer.revokedSince ? 1 : 0;
    record.uncovered += signer.isRevocationChecked && !signer.listUntil ? 1 : 0;
  }
  return record;
}

}  // namespace

TrustWatch::TrustWatch(std::shared_ptr<TrustParts> parts) : parts_(std::move(parts)) {}

void TrustWatch::Reload() {
  if (activity_.IsRunningHere()) {
    throw Tarnik::InvalidStateException("A listener of the trust store must not reload it.");
  }
  const ActivityScope scope(activity_);
  const std::lock_guard lock(mutex_);
  lastLook_ = {};
  Read(false);
}

void TrustWatch::Begin() noexcept {
  if (!isStopped_ && !isArmed_.exchange(true)) {
    nextLook_ = {};
    Arm();
  }
}

void TrustWatch::Stop(std::chrono::milliseconds limit) {
  isStopped_ = true;
  SetTimer(nullptr);
  if (Tarnik::System::IsProcessEnding()) {
    return;
  }
  // The code of the listener may be that of a plug-in, which is unloaded next.
  if (activity_.WaitUntilIdle(limit) && !activity_.IsRunningHere()) {
    parts_->config.listener.reset();
  }
}

void TrustWatch::SetTimer(Tarnik::Ref<Tarnik::System::CancellableItem> timer) {
  {
    const std::lock_guard lock(timerMutex_);
    timer_.swap(timer);
    if (isStopped_ && timer_ != nullptr) {
      timer = std::move(timer_);
    }
  }
  if (isStopped_ && timer != nullptr) {
    timer->Cancel();
  }
}

void TrustWatch::Arm() noexcept {
  if (isStopped_) {
    return;
  }
  try {
    const Instant::Steady now = parts_->runtime->Now().steady;
    nextLook_ = nextLook_ + kPeriod > now ? nextLook_ + kPeriod : now + kPeriod;
    SetTimer(parts_->runtime->RunAt(nextLook_, [weak = weak_from_this()] {
      if (const auto watch = weak.lock()) {
        watch->OnTimer();
      }
    }));
  } catch (...) {
    isArmed_ = false;
  }
}

void TrustWatch::OnTimer() noexcept {
  try {
    parts_->runtime->Run([weak = weak_from_this()] {
      if (const auto watch = weak.lock()) {
        watch->OnWorker();
      }
    });
  } catch (...) {
    Arm();
  }
}

void TrustWatch::OnWorker() noexcept {
  try {
    const ActivityScope scope(activity_);
    if (isStopped_) {
      return;
    }
    Look();
  } catch (...) {
    // The trust stays as it was, and the next look tries again.
  }
  Arm();
}

void TrustWatch::Look() {
  const std::unique_lock lock(mutex_, std::try_to_lock);
  if (!lock.owns_lock()) {
    return;  // `Reload` reads the files
  }
  TrustListing now = ListFiles(parts_->config.issuers);
  const bool isSame = now == lastLook_;
  lastLook_ = std::move(now);
  if (lastLook_ == settled_) {
    looksWithChanges_ = 0;
    return;
  }
  ++looksWithChanges_;
  if (isSame || looksWithChanges_ >= kLatestLook) {
    Read(isSame);
  }
}

void TrustWatch::Read(bool isSettled) {
  looksWithChanges_ = 0;
  settled_ = {};
  TrustListing listing;
  const auto settle = [&] {
    if (isSettled && listing == lastLook_) {
      settled_ = std::move(listing);
    }
  };
  try {
    ReadAll(listing);
  } catch (const Tarnik::Crypto::CryptoException& error) {
    Keep(listing, error.Message());
    settle();
    throw;
  } catch (const Tarnik::Exception& error) {
    // Not settled: the reason may pass without a change of the files.
    Keep(listing, error.Message());
    throw;
  } catch (const std::bad_alloc&) {
    Keep(listing, Tarnik::OutOfMemory().Message());
    throw;
  }
  settle();
}

void TrustWatch::ReadAll(TrustListing& listing) {
  const TrustContents contents = ReadUnchanged(parts_->config.issuers, listing);
  std::shared_ptr<const Trust> trust = parts_->cell.Get()->trust;
  if (contents.digest != trust->digest) {
    trust = BuildTrust(parts_->config.issuers, contents);
  }
  Replace(std::move(trust));
}

void TrustWatch::Replace(std::shared_ptr<const Trust> trust) {
  const auto previous = parts_->cell.Get();
  TrustRecord record = RecordOf(parts_->config, *trust);
  record.added = CountMissing(*trust, *previous->trust);
  record.removed = CountMissing(*previous->trust, *trust);
  const bool isNews = trust != previous->trust || !previous->failure.empty();
  parts_->cell.Set(MakeTrustState(std::move(trust), parts_->runtime->Now().wall));
  reported_ = {};
  reportedFailure_.clear();
  if (isNews) {
    Report(record);
  }
}

void TrustWatch::Keep(const TrustListing& listing, const std::string& failure) {
  const auto previous = parts_->cell.Get();
  parts_->cell.Set(
      std::make_shared<const TrustState>(TrustState{previous->trust, previous->loadedAt, failure}));
  if (failure == reportedFailure_ && listing == reported_) {
    return;
  }
  TrustRecord record = RecordOf(parts_->config, *previous->trust);
  record.failure = failure;
  reported_ = listing;
  reportedFailure_ = failure;
  Report(record);
}

void TrustWatch::Report(const TrustRecord& record) noexcept {
  TrustListener* const listener = parts_->config.listener.get();
  if (listener == nullptr || isStopped_) {
    return;
  }
  try {
    if (record.failure.empty()) {
      listener->OnTrustReplaced(record);
    } else {
      listener->OnTrustKept(record);
    }
  } catch (...) {
    // As documented.
  }
}

}  // namespace SsoClient::Access
