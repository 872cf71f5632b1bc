#ifndef SSOCLIENT_TESTS_CALLS_FREED_MEMORY_H
#define SSOCLIENT_TESTS_CALLS_FREED_MEMORY_H

#include <atomic>
#include <cstddef>
#include <string>

namespace SsoClient::Testing {

/// Searches all memory that is released during its lifetime for a text, or for pieces of it. For
/// this, the program replaces `operator delete`. At most one object may exist at a time.
class FreedMemory {
 public:
  explicit FreedMemory(std::string text);
  /// Searches for any `piece` bytes of the text that follow each other. At most all of them.
  FreedMemory(std::string text, std::size_t piece);
  FreedMemory(const FreedMemory&) = delete;
  FreedMemory& operator=(const FreedMemory&) = delete;
  ~FreedMemory();

  /// The number of blocks that held the text, or a piece of it, when they were released.
  int Finds() const { return finds_; }

  void Search(const void* memory) noexcept;

 private:
  const std::string text_;
  const std::size_t piece_;
  std::atomic<int> finds_ = 0;
};

}  // namespace SsoClient::Testing

#endif
