#ifndef SSOCLIENT_ACCESS_TESTS_END_TO_END_SILENT_RESOLVER_H
#define SSOCLIENT_ACCESS_TESTS_END_TO_END_SILENT_RESOLVER_H

#include <cstddef>

namespace SsoClient::Access::Testing {

/// As long as it exists, look-ups of `kSilentHost` in this program are not answered. At most one
/// object may exist at a time.
class SilentResolver {
 public:
  static constexpr const char* kSilentHost = "silent.invalid";

  SilentResolver();
  SilentResolver(const SilentResolver&) = delete;
  SilentResolver& operator=(const SilentResolver&) = delete;
  ~SilentResolver();

  /// Waits until so many look-ups have begun. Returns false if they do not within a minute.
  bool Await(std::size_t lookUps) const;
};

}  // namespace SsoClient::Access::Testing

#endif
