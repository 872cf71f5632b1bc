#include "errors.h"

#include <string>
#include <string_view>

#include <gssapi/gssapi.h>
#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "credentials.h"
#include "handles.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

std::string MessageOf(const GssStatus& status) {
  return ThrownMessage<SsoException>([&] { CheckGssStatus("The attempt failed", status); });
}

TEST(GssErrorTest, LetsSuccessPass) {
  EXPECT_NO_THROW(CheckGssStatus("The attempt failed", {}));
  EXPECT_NO_THROW(CheckGssStatus("The attempt failed", {GSS_S_CONTINUE_NEEDED, 0}));
  // Some calls set a minor code even if they succeed.
  EXPECT_NO_THROW(CheckGssStatus("The attempt failed", {GSS_S_COMPLETE, 22}));
}

TEST(GssErrorTest, ReportsOnlyTheMajorCode) {
  EXPECT_EQ(MessageOf({GSS_S_NO_CRED, 0}),
            "The attempt failed: No credentials were supplied, or the credentials were unavailable "
            "or inaccessible.");
}

TEST(GssErrorTest, ReportsBothPartsOfAMajorCode) {
  EXPECT_EQ(
      MessageOf({GSS_S_CALL_BAD_STRUCTURE | GSS_S_BAD_MECH, 0}),
      "The attempt failed: A parameter was malformed, An unsupported mechanism was requested.");
}

// The library's own text ends in a blank and a NUL.
TEST(GssErrorTest, ReportsTheMinorCodeWithoutTrailingBlanksAndNuls) {
  GssCredential credentials;
  gss_OID_set_desc mechanisms{1, SpnegoMechanism()};
  GssStatus status;
  char malformed[] = "a@b@c";
  gss_buffer_desc text{sizeof(malformed) - 1, malformed};
  GssName name;
  ASSERT_EQ(gss_import_name(&status.minor, &text, GSS_C_NT_USER_NAME, name.Address()),
            static_cast<OM_uint32>(GSS_S_COMPLETE));
  status.major = gss_acquire_cred(&status.minor, name.Get(), GSS_C_INDEFINITE, &mechanisms,
                                  GSS_C_INITIATE, credentials.Address(), nullptr, nullptr);
  EXPECT_EQ(MessageOf(status),
            "The attempt failed: An invalid name was supplied (SPNEGO cannot find mechanisms to "
            "negotiate).");
}

TEST(PlainTextTest, LeavesTextUnchanged) {
  EXPECT_EQ(PlainText(""), "");
  EXPECT_EQ(PlainText("Ticket expired"), "Ticket expired");
  EXPECT_EQ(PlainText("Jeton expiré"), "Jeton expiré");
}

TEST(PlainTextTest, DropsTrailingBlanksAndControlCharacters) {
  EXPECT_EQ(PlainText(std::string_view("no token \0", 10)), "no token");
  EXPECT_EQ(PlainText(" two lines\r\n\n"), " two lines");
  EXPECT_EQ(PlainText(" \n "), "");
}

TEST(PlainTextTest, StaysOnOneLine) {
  EXPECT_EQ(PlainText(std::string_view("a\nb\x1b[1mc\0d\x7f!", 12)), "a?b?[1mc?d?!");
}

TEST(PlainTextTest, IsUtf8) {
  for (const std::string kept : {"\xc2\xa0", "\xdf\xbf", "\xe0\xa0\x80", "\xed\x9f\xbf",
                                 "\xee\x80\x80", "\xf0\x90\x80\x80", "\xf4\x8f\xbf\xbf"}) {
    EXPECT_EQ(PlainText("a" + kept + "b"), "a" + kept + "b");
    EXPECT_EQ(PlainText(kept), kept);
    // Its incomplete beginnings are not.
    for (std::size_t size = 1; size < kept.size(); ++size) {
      EXPECT_EQ(PlainText("a" + kept.substr(0, size) + "b"), "a" + std::string(size, '?') + "b");
      EXPECT_EQ(PlainText(kept.substr(0, size)), std::string(size, '?'));
    }
  }
  for (const std::string broken :
       {"\x80", "\xbf\xbf", "\xc0\x80", "\xc1\xbf", "\xe0\x9f\xbf", "\xed\xa0\x80", "\xed\xbf\xbf",
        "\xf0\x8f\xbf\xbf", "\xf4\x90\x80\x80", "\xf5\x80\x80\x80", "\xff\xfe"}) {
    EXPECT_EQ(PlainText("a" + broken + "b"), "a" + std::string(broken.size(), '?') + "b");
  }
}

TEST(PlainTextTest, ContainsNoTwoByteControlCharacters) {
  EXPECT_EQ(PlainText("a\xc2\x9b[1mb\xc2\x80"), "a?[1mb?");
}

TEST(PlainTextTest, IsBounded) {
  EXPECT_EQ(PlainText(std::string(500, 'x')), std::string(500, 'x'));
  EXPECT_EQ(PlainText(std::string(501, 'x')), std::string(500, 'x') + "...");
  EXPECT_EQ(PlainText(std::string(499, 'x') + "\xc3\xa9"), std::string(499, 'x') + "...");
}

}  // namespace
}  // namespace SsoClient::Testing
