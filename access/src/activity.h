#ifndef SSOCLIENT_ACCESS_ACTIVITY_H
#define SSOCLIENT_ACCESS_ACTIVITY_H

#include <chrono>
#include <condition_variable>
#include <mutex>

namespace SsoClient::Access {

/// Counts the functions of the user that run, or that are due, so that `Stop` can wait for them.
/// Thread-safe.
class Activity {
 public:
  void Begin() noexcept;
  void End() noexcept;
  /// Waits at most `limit` until nothing is left but what runs on this thread; false if the time
  /// was too short. A negative limit is zero.
  bool WaitUntilIdle(std::chrono::milliseconds limit);
  /// Whether something that has begun runs on this thread.
  bool IsRunningHere() const noexcept { return CountOnThisThread() > 0; }

  /// Marks what has begun as running on this thread.
  class OwnThread {
   public:
    explicit OwnThread(const Activity& activity) noexcept;
    ~OwnThread();
    OwnThread(const OwnThread&) = delete;
    OwnThread& operator=(const OwnThread&) = delete;

   private:
    friend class Activity;

    const Activity& activity_;
    const OwnThread* const outer_;
  };

 private:
  int CountOnThisThread() const noexcept;

  std::mutex mutex_;
  std::condition_variable ended_;
  int count_ = 0;
};

/// From the construction to the destruction, on one thread.
class ActivityScope {
 public:
  explicit ActivityScope(Activity& activity) noexcept
      : begun_(activity), ownThread_(begun_.activity) {}

 private:
  struct Begun {
    explicit Begun(Activity& a) noexcept : activity(a) { activity.Begin(); }
    ~Begun() { activity.End(); }
    Begun(const Begun&) = delete;
    Begun& operator=(const Begun&) = delete;

    Activity& activity;
  };

  const Begun begun_;
  const Activity::OwnThread ownThread_;
};

}  // namespace SsoClient::Access

#endif
