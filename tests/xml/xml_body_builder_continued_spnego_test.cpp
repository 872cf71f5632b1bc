#include "xml/request_bodies.h"

#include <gmock/gmock.h>

#include "xml/built_xml.h"

namespace SsoClient {
namespace {

TEST(XMLBodyBuilderContinuedSPNegoTest, IsABareResponseWithTheLegAndTheContext) {
  EXPECT_EQ(Testing::BuiltXml(XMLBodyBuilderContinuedSPNego("urn:c\"<", {1, 2})),
            "<wst:RequestSecurityTokenResponse Context=\"urn:c&quot;&lt;\">" +
                Testing::BuiltXml(*BuildBinaryExchange({1, 2})) +
                "</wst:RequestSecurityTokenResponse>");
}

}  // namespace
}  // namespace SsoClient
