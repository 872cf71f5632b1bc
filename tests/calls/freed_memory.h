#ifndef SSOCLIENT_TESTS_CALLS_FREED_MEMORY_H
#define SSOCLIENT_TESTS_CALLS_FREED_MEMORY_H

#include <atomic>
#include <string>

namespace SsoClient::Testing {

/// Searches all memory that is released during its lifetime for a text. For this, the program
/// replaces `operator delete`. At most one object may exist at a time.
class FreedMemory {
 public:
  explicit FreedMemory(std::string text);
  FreedMemory(const FreedMemory&) = delete;
  FreedMemory& operator=(const FreedMemory&) = delete;
  ~FreedMemory();

  /// The number of blocks that held the text when they were released.
  int Finds() const { return finds_; }

  void Search(const void* memory) noexcept;

 private:
  const std::string text_;
  std::atomic<int> finds_ = 0;
};

}  // namespace SsoClient::Testing

#endif
