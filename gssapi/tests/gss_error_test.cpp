#include "gss_error.h"

#include <ssoclient/exceptions.h>

#include "gss_credentials.h"
#include "gss_handle.h"
#include "support/thrown_message.h"

namespace SsoClient {
namespace {

using Testing::ThrownMessage;

std::string MessageOf(const GssStatus& status) {
  return ThrownMessage<SsoException>([&] { CheckGssStatus("The attempt failed", status); });
}

TEST(GssErrorTest, LetsSuccessPass) {
  EXPECT_NO_THROW(CheckGssStatus("The attempt failed", {}));
  EXPECT_NO_THROW(CheckGssStatus("The attempt failed", {GSS_S_CONTINUE_NEEDED, 0}));
  // Some calls leave a minor code behind when all is well.
  EXPECT_NO_THROW(CheckGssStatus("The attempt failed", {GSS_S_COMPLETE, 22}));
}

TEST(GssErrorTest, TellsTheMajorCodeAlone) {
  EXPECT_EQ(MessageOf({GSS_S_NO_CRED, 0}),
            "The attempt failed: No credentials were supplied, or the credentials were unavailable "
            "or inaccessible.");
}

TEST(GssErrorTest, TellsBothPartsOfAMajorCode) {
  EXPECT_EQ(
      MessageOf({GSS_S_CALL_BAD_STRUCTURE | GSS_S_BAD_MECH, 0}),
      "The attempt failed: A parameter was malformed, An unsupported mechanism was requested.");
}

// The library's own text ends in a blank and a NUL.
TEST(GssErrorTest, TellsTheMinorCodeWithoutWhatIsNotText) {
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

}  // namespace
}  // namespace SsoClient
