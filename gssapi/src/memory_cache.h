#ifndef SSOCLIENT_GSSAPI_MEMORY_CACHE_H
#define SSOCLIENT_GSSAPI_MEMORY_CACHE_H

#include <string>

namespace SsoClient {

/// A credential cache in memory, under a name that nobody else uses. Its tickets are destroyed with
/// it.
class MemoryCache {
 public:
  MemoryCache();
  MemoryCache(const MemoryCache&) = delete;
  MemoryCache& operator=(const MemoryCache&) = delete;
  ~MemoryCache();

  const std::string& Name() const noexcept { return name_; }

 private:
  std::string name_;
};

}  // namespace SsoClient

#endif
