#include "ssl/tls_error_text.h"

#include <string>
#include <utility>

#include <gtest/gtest.h>

#include "ssl/tls_fixture.h"

namespace Tarnik::Testing {
namespace {

using Ssl::TlsErrorText;

class TlsErrorTextTest : public testing::Test {
 protected:
  // OpenSSL has words for alerts only after it has loaded its texts.
  TlsErrorTextTest() { OPENSSL_init_ssl(OPENSSL_INIT_LOAD_SSL_STRINGS, nullptr); }
};

unsigned long AlertError(int alert) {
  return ERR_PACK(ERR_LIB_SSL, 0, SSL_AD_REASON_OFFSET + alert);
}

// RFC 8446, section 6, and RFC 5246, section 7.2, for the numbers that TLS 1.3 no longer uses.
TEST_F(TlsErrorTextTest, NamesTheAlertsOfThePeer) {
  for (const auto& [alert, name] : {
           std::pair{10, "unexpected_message"},
           std::pair{20, "bad_record_mac"},
           std::pair{21, "decryption_failed"},
           std::pair{22, "record_overflow"},
           std::pair{30, "decompression_failure"},
           std::pair{40, "handshake_failure"},
           std::pair{41, "no_certificate"},
           std::pair{42, "bad_certificate"},
           std::pair{43, "unsupported_certificate"},
           std::pair{44, "certificate_revoked"},
           std::pair{45, "certificate_expired"},
           std::pair{46, "certificate_unknown"},
           std::pair{47, "illegal_parameter"},
           std::pair{48, "unknown_ca"},
           std::pair{49, "access_denied"},
           std::pair{50, "decode_error"},
           std::pair{51, "decrypt_error"},
           std::pair{60, "export_restriction"},
           std::pair{70, "protocol_version"},
           std::pair{71, "insufficient_security"},
           std::pair{80, "internal_error"},
           std::pair{86, "inappropriate_fallback"},
           std::pair{100, "no_renegotiation"},
           std::pair{109, "missing_extension"},
           std::pair{110, "unsupported_extension"},
           std::pair{112, "unrecognized_name"},
           std::pair{113, "bad_certificate_status_response"},
           std::pair{115, "unknown_psk_identity"},
           std::pair{116, "certificate_required"},
           std::pair{120, "no_application_protocol"},
       }) {
    EXPECT_EQ(TlsErrorText(AlertError(alert)), SentAlert(name, alert));
  }
}

TEST_F(TlsErrorTextTest, NumbersAnAlertWithoutAName) {
  for (const int alert : {0, 99, 255}) {
    EXPECT_EQ(TlsErrorText(AlertError(alert)), "the peer sent the alert " + std::to_string(alert));
  }
}

TEST_F(TlsErrorTextTest, IsOpenSslsReasonForOtherErrors) {
  for (const int reason : {SSL_R_WRONG_VERSION_NUMBER, SSL_R_NO_CIPHERS_AVAILABLE}) {
    const unsigned long error = ERR_PACK(ERR_LIB_SSL, 0, reason);
    EXPECT_EQ(TlsErrorText(error), ERR_reason_error_string(error));
  }
  // The number of an alert, but an error of another library.
  EXPECT_EQ(TlsErrorText(ERR_PACK(ERR_LIB_X509, 0, SSL_AD_REASON_OFFSET + 40)), "unknown cause");
  EXPECT_EQ(TlsErrorText(ERR_PACK(ERR_LIB_SSL, 0, SSL_AD_REASON_OFFSET + 256)), "unknown cause");
  EXPECT_EQ(TlsErrorText(0), "unknown cause");
}

}  // namespace
}  // namespace Tarnik::Testing
