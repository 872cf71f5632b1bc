#ifndef SSOCLIENT_TESTS_CALLS_FREED_MEMORY_H
#define SSOCLIENT_TESTS_CALLS_FREED_MEMORY_H

#include <atomic>
#include <string>

namespace SsoClient::Testing {

/// Looks, while it lives, for a text in all memory that `operator delete` gives back, which this
/// program has one of its own of. One at a time.
class FreedMemory {
 public:
  explicit FreedMemory(std::string text);
  FreedMemory(const FreedMemory&) = delete;
  FreedMemory& operator=(const FreedMemory&) = delete;
  ~FreedMemory();

  /// How many pieces of memory held the text when they were given back.
  int Finds() const { return finds_; }

  void Look(const void* memory) noexcept;

 private:
  const std::string text_;
  std::atomic<int> finds_ = 0;
};

}  // namespace SsoClient::Testing

#endif
