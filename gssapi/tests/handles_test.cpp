#include "handles.h"

#include <cstdlib>
#include <cstring>
#include <string>

#include <gssapi/gssapi.h>
#include <gtest/gtest.h>

#include "replaced_calls.h"

namespace SsoClient::Testing {
namespace {

constexpr char kSecret[] = "data that authenticates a client";

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
  EXPECT_EQ(LastReleasedBuffer(), std::string(kSecret, sizeof(kSecret)));
  {
    GssBuffer buffer;
    Fill(buffer.Address());
  }
  EXPECT_EQ(LastReleasedBuffer(), std::string(sizeof(kSecret), '\0'));
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
}  // namespace SsoClient::Testing
