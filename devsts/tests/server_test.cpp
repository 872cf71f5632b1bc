#include "devsts/server.h"

#include <gmock/gmock.h>

TEST(Server, StartsAndStops) {
  const DevSts::Server server;
  EXPECT_NE(server.HttpPort(), 0);
  EXPECT_NE(server.HttpsPort(), 0);
}
