#include "memory_cache.h"

#include <tarnik/text/string_util.h>

#include "krb5_handles.h"

namespace SsoClient {

MemoryCache::MemoryCache() : name_("MEMORY:" + Tarnik::StringUtil::GenerateUuid()) {}

// GSSAPI makes the cache when it first has tickets to keep, but has no call that destroys it.
MemoryCache::~MemoryCache() {
  const auto context = CreateKrb5Context();
  krb5_ccache cache = nullptr;
  if (context != nullptr && krb5_cc_resolve(context.get(), name_.c_str(), &cache) == 0) {
    krb5_cc_destroy(context.get(), cache);
  }
}

}  // namespace SsoClient
