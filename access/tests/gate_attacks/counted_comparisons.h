#ifndef SSOCLIENT_ACCESS_TESTS_GATE_ATTACKS_COUNTED_COMPARISONS_H
#define SSOCLIENT_ACCESS_TESTS_GATE_ATTACKS_COUNTED_COMPARISONS_H

#include <cstddef>
#include <vector>

namespace SsoClient::Access::Testing {

/// Records comparisons in constant time on this thread during its life.
class CountedComparisons {
 public:
  CountedComparisons();
  ~CountedComparisons();
  CountedComparisons(const CountedComparisons&) = delete;
  CountedComparisons& operator=(const CountedComparisons&) = delete;

  /// The number of bytes of each.
  const std::vector<std::size_t>& Lengths() const { return lengths_; }
  void Add(std::size_t length) { lengths_.push_back(length); }

 private:
  std::vector<std::size_t> lengths_;
};

}  // namespace SsoClient::Access::Testing

#endif
