#include "http/connection.h"

#include <atomic>
#include <memory>
#include <string>
#include <string_view>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/system/stream.h>

#include "http/exchange_fixture.h"
#include "support/scripted_stream.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Http;

/// What the handler of one read has received.
struct ReadResult {
  std::atomic<bool> isThere{false};
  std::string bytes;
  std::string error;
};

class ConnectionTest : public testing::Test {
 protected:
  void TearDown() override {
    connection_->Close();
    connection_ = nullptr;
    stream_ = nullptr;
    EXPECT_TRUE(Eventually([] { return ScriptedStream::LiveCount() == 0; }));
  }

  void Watch() {
    connection_->Watch([isLost = isLost_] { *isLost = true; });
  }

  Connection::ReadHandler Into(const std::shared_ptr<ReadResult>& result) {
    return [result](std::string_view bytes, const Exception* error) {
      result->bytes = bytes;
      result->error = error == nullptr ? "" : error->Message();
      result->isThere = true;
    };
  }

  std::shared_ptr<ReadResult> ReadNow() {
    auto result = std::make_shared<ReadResult>();
    connection_->Read(Into(result));
    EXPECT_TRUE(Eventually([&] { return result->isThere.load(); }));
    return result;
  }

  Ref<ScriptedStream> stream_ = MakeRef<ScriptedStream>(ScriptedStream::Script{});
  Ref<Connection> connection_ = MakeRef<Connection>(Ref<System::Stream>(stream_));
  std::shared_ptr<std::atomic<bool>> isLost_ = std::make_shared<std::atomic<bool>>(false);
};

TEST_F(ConnectionTest, ReadsWhatArrives) {
  stream_->Push("one");
  EXPECT_EQ(ReadNow()->bytes, "one");
  stream_->Push("two");
  EXPECT_EQ(ReadNow()->bytes, "two");
}

TEST_F(ConnectionTest, HandsItsIdleReadToTheNextReader) {
  Watch();
  EXPECT_TRUE(stream_->IsRead());
  EXPECT_TRUE(connection_->Claim());
  const auto result = std::make_shared<ReadResult>();
  connection_->Read(Into(result));
  stream_->Push("answer");
  EXPECT_TRUE(Eventually([&] { return result->isThere.load(); }));
  EXPECT_EQ(result->bytes, "answer");
  EXPECT_FALSE(*isLost_);
}

TEST_F(ConnectionTest, IsLostWhenAnythingArrivesWhileIdle) {
  Watch();
  stream_->Push("x");
  EXPECT_TRUE(Eventually([&] { return isLost_->load(); }));
  EXPECT_FALSE(connection_->Claim());
}

TEST_F(ConnectionTest, CannotBeClaimedUnlessItIsWatched) {
  EXPECT_FALSE(connection_->Claim());
}

TEST_F(ConnectionTest, KeepsWhatArrivesBetweenClaimAndRead) {
  Watch();
  ASSERT_TRUE(connection_->Claim());
  stream_->Push("early");
  ASSERT_TRUE(Eventually([&] { return !stream_->IsRead(); }));
  EXPECT_EQ(ReadNow()->bytes, "early");
  stream_->Push("later");
  EXPECT_EQ(ReadNow()->bytes, "later");
  EXPECT_FALSE(*isLost_);
}

TEST_F(ConnectionTest, KeepsAFailureBetweenClaimAndRead) {
  Watch();
  ASSERT_TRUE(connection_->Claim());
  stream_->PushError("Connection reset by peer");
  ASSERT_TRUE(Eventually([&] { return !stream_->IsRead(); }));
  const auto result = ReadNow();
  EXPECT_EQ(result->bytes, "");
  EXPECT_EQ(result->error, "Connection reset by peer");
}

TEST_F(ConnectionTest, ClosesItsStreamWhenDestroyed) {
  connection_ =
      MakeRef<Connection>(Ref<System::Stream>(MakeRef<ScriptedStream>(ScriptedStream::Script{})));
  EXPECT_TRUE(stream_->IsClosed());
}

TEST_F(ConnectionTest, IsNotSecureOverAPlainStream) {
  EXPECT_FALSE(connection_->IsSecure());
}

}  // namespace
}  // namespace Tarnik::Testing
