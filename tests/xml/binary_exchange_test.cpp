#include "xml/request_bodies.h"

#include <gmock/gmock.h>

#include "xml/built_xml.h"

namespace SsoClient {
namespace {

constexpr char kStart[] =
    "<wst:BinaryExchange EncodingType=\"http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-soap-message-security-1.0#Base64Binary\""
    " ValueType=\"http://schemas.xmlsoap.org/ws/2005/02/trust/spnego\">";

TEST(BinaryExchangeTest, CarriesTheLegInBase64) {
  EXPECT_EQ(Testing::BuiltXml(*BuildBinaryExchange({0x00, 0xFF, 0x10, 0x80})),
            std::string(kStart) + "AP8QgA==</wst:BinaryExchange>");
}

TEST(BinaryExchangeTest, AnEmptyLegIsAnEmptyText) {
  EXPECT_EQ(Testing::BuiltXml(*BuildBinaryExchange({})),
            std::string(kStart) + "</wst:BinaryExchange>");
}

}  // namespace
}  // namespace SsoClient
