#include "xml/request_bodies.h"

#include <gmock/gmock.h>

#include "xml/built_xml.h"

namespace SsoClient {
namespace {

TEST(ParticipantsTest, HoldsOneParticipantForEachAudienceInOrder) {
  EXPECT_EQ(Testing::BuiltXml(*BuildParticipants({"b", "a"})),
            "<wst:Participants xmlns:wsa=\"http://www.w3.org/2005/08/addressing\">"
            "<wst:Participant><wsa:EndpointReference><wsa:Address>a</wsa:Address>"
            "</wsa:EndpointReference></wst:Participant>"
            "<wst:Participant><wsa:EndpointReference><wsa:Address>b</wsa:Address>"
            "</wsa:EndpointReference></wst:Participant></wst:Participants>");
}

TEST(ParticipantsTest, IsAnEmptyElementWithoutAudiences) {
  EXPECT_EQ(Testing::BuiltXml(*BuildParticipants({})),
            "<wst:Participants xmlns:wsa=\"http://www.w3.org/2005/08/addressing\"/>");
}

}  // namespace
}  // namespace SsoClient
