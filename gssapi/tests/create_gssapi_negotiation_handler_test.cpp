#include <ssoclient/gssapi_negotiation_handler.h>

#include <tarnik/core/exception.h>

#include "support/thrown_message.h"

namespace SsoClient {
namespace {

using Testing::ThrownMessage;

constexpr char kService[] = "HTTP@sts.example";
const std::string kWithNul("a\0b", 3);

struct BadConfig {
  const char* name;
  GssapiNegotiationConfig config;
  std::string message;
};

class BadGssapiNegotiationConfigTest : public testing::TestWithParam<BadConfig> {};

TEST_P(BadGssapiNegotiationConfigTest, IsRefusedAtOnce) {
  EXPECT_EQ(ThrownMessage<Tarnik::InvalidArgumentException>(
                [] { CreateGssapiNegotiationHandler(GetParam().config); }),
            "GssapiNegotiationConfig: " + GetParam().message);
}

std::string NotOfTheForm(const std::string& service) {
  return "the target service `" + service + "' is not of the form service@host.";
}

INSTANTIATE_TEST_SUITE_P(
    All, BadGssapiNegotiationConfigTest,
    testing::Values(
        BadConfig{"NoService", {}, "the target service must not be empty."},
        BadConfig{
            "NulInService", {kWithNul, "", "", ""}, "the target service must not hold a NUL."},
        BadConfig{
            "NulInPrincipal", {kService, kWithNul, "", ""}, "the principal must not hold a NUL."},
        BadConfig{"NulInKeytab", {kService, "", kWithNul, ""}, "the keytab must not hold a NUL."},
        BadConfig{"NulInCache",
                  {kService, "", "", kWithNul},
                  "the credential cache must not hold a NUL."},
        BadConfig{"ServiceAlone", {"HTTP", "", "", ""}, NotOfTheForm("HTTP")},
        BadConfig{"NoHost", {"HTTP@", "", "", ""}, NotOfTheForm("HTTP@")},
        BadConfig{"NoServiceName", {"@host", "", "", ""}, NotOfTheForm("@host")},
        BadConfig{"Principal", {"HTTP/host", "", "", ""}, NotOfTheForm("HTTP/host")},
        BadConfig{"PrincipalWithRealm", {"HTTP/host@A", "", "", ""}, NotOfTheForm("HTTP/host@A")},
        BadConfig{"TwoHosts", {"HTTP@a@b", "", "", ""}, NotOfTheForm("HTTP@a@b")}),
    [](const auto& instance) { return instance.param.name; });

TEST(CreateGssapiNegotiationHandlerTest, LooksForNeitherTicketsNorFiles) {
  const auto handler = CreateGssapiNegotiationHandler(
      {kService, "machine", "/nonexistent/keytab", "FILE:/nonexistent"});
  ASSERT_NE(handler, nullptr);
  EXPECT_FALSE(handler->IsEstablished());
}

}  // namespace
}  // namespace SsoClient
