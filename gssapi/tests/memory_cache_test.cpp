#include "memory_cache.h"

#include "krb5_handles.h"

namespace SsoClient {
namespace {

krb5_ccache Resolve(const Krb5Context& context, const std::string& name) {
  krb5_ccache cache = nullptr;
  EXPECT_EQ(krb5_cc_resolve(context.get(), name.c_str(), &cache), 0);
  return cache;
}

bool HasOwner(const Krb5Context& context, const std::string& name) {
  krb5_ccache cache = Resolve(context, name);
  krb5_principal owner = nullptr;
  const bool hasOwner = krb5_cc_get_principal(context.get(), cache, &owner) == 0;
  krb5_free_principal(context.get(), owner);
  krb5_cc_close(context.get(), cache);
  return hasOwner;
}

TEST(MemoryCacheTest, DestroysWhatIsInIt) {
  const auto context = CreateKrb5Context();
  ASSERT_NE(context, nullptr);
  std::string name;
  {
    const MemoryCache cache;
    name = cache.Name();
    krb5_principal owner = nullptr;
    ASSERT_EQ(krb5_parse_name(context.get(), "alice@EXAMPLE.COM", &owner), 0);
    krb5_ccache opened = Resolve(context, name);
    EXPECT_EQ(krb5_cc_initialize(context.get(), opened, owner), 0);
    krb5_cc_close(context.get(), opened);
    krb5_free_principal(context.get(), owner);
    EXPECT_TRUE(HasOwner(context, name));
  }
  EXPECT_FALSE(HasOwner(context, name));
}

TEST(MemoryCacheTest, BelongsToItsOwnerAlone) {
  const MemoryCache one;
  const MemoryCache other;
  EXPECT_EQ(one.Name().rfind("MEMORY:", 0), 0U);
  EXPECT_NE(one.Name(), other.Name());
}

}  // namespace
}  // namespace SsoClient
