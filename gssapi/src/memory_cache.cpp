#include "memory_cache.h"

#include <krb5.h>

#include <tarnik/text/string_util.h>

namespace SsoClient {

MemoryCache::MemoryCache() : name_("MEMORY:" + Tarnik::StringUtil::GenerateUuid()) {}

// GSSAPI makes the cache when it first has tickets to keep, but has no call that destroys it.
MemoryCache::~MemoryCache() {
  krb5_context context = nullptr;
  if (krb5_init_context(&context) != 0) {
    return;
  }
  krb5_ccache cache = nullptr;
  if (krb5_cc_resolve(context, name_.c_str(), &cache) == 0) {
    krb5_cc_destroy(context, cache);
  }
  krb5_free_context(context);
}

}  // namespace SsoClient
