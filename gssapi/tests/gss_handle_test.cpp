#include "gss_handle.h"

#include <gmock/gmock.h>

#include <atomic>
#include <cstdlib>
#include <cstring>
#include <string>

namespace {

std::atomic<bool> hasReleasedASecret{false};

constexpr char kSecret[] = "what logs somebody in";

}  // namespace

// The linker puts the second for the first, and leaves the library's own as the first.
extern "C" {

OM_uint32 __real_gss_release_buffer(OM_uint32*, gss_buffer_t);

OM_uint32 __wrap_gss_release_buffer(OM_uint32* minor, gss_buffer_t buffer) {
  const std::string content(static_cast<const char*>(buffer->value), buffer->length);
  hasReleasedASecret = hasReleasedASecret || content.find(kSecret) != std::string::npos;
  return __real_gss_release_buffer(minor, buffer);
}
}

namespace SsoClient {
namespace {

void Fill(gss_buffer_t buffer) {
  buffer->length = sizeof(kSecret);
  buffer->value = std::malloc(buffer->length);
  std::memcpy(buffer->value, kSecret, buffer->length);
}

TEST(GssBufferTest, IsCleansedBeforeItIsReleased) {
  gss_buffer_desc plain;
  Fill(&plain);
  OM_uint32 minor = 0;
  ::gss_release_buffer(&minor, &plain);
  EXPECT_TRUE(hasReleasedASecret.exchange(false));
  {
    GssBuffer buffer;
    Fill(buffer.Address());
  }
  EXPECT_FALSE(hasReleasedASecret);
}

TEST(GssBufferTest, MayBeReleasedEmptyAndTwice) {
  GssBuffer buffer;
  buffer.Reset();
  Fill(buffer.Address());
  buffer.Reset();
  EXPECT_EQ(buffer.Get().value, nullptr);
  buffer.Reset();
}

}  // namespace
}  // namespace SsoClient
