#include "ssl/tls_error_text.h"

#include <algorithm>
#include <iterator>

#include <openssl/err.h>
#include <openssl/ssl.h>

namespace Tarnik::Ssl {
namespace {

struct AlertName {
  int alert;
  const char* name;
};

// RFC 8446, sections 6.2 and B.2: all alerts that end a connection, with those of older versions.
constexpr AlertName kAlertNames[] = {
    {SSL_AD_UNEXPECTED_MESSAGE, "unexpected_message"},
    {SSL_AD_BAD_RECORD_MAC, "bad_record_mac"},
    {SSL_AD_DECRYPTION_FAILED, "decryption_failed"},
    {SSL_AD_RECORD_OVERFLOW, "record_overflow"},
    {SSL_AD_DECOMPRESSION_FAILURE, "decompression_failure"},
    {SSL_AD_HANDSHAKE_FAILURE, "handshake_failure"},
    {SSL_AD_NO_CERTIFICATE, "no_certificate"},
    {SSL_AD_BAD_CERTIFICATE, "bad_certificate"},
    {SSL_AD_UNSUPPORTED_CERTIFICATE, "unsupported_certificate"},
    {SSL_AD_CERTIFICATE_REVOKED, "certificate_revoked"},
    {SSL_AD_CERTIFICATE_EXPIRED, "certificate_expired"},
    {SSL_AD_CERTIFICATE_UNKNOWN, "certificate_unknown"},
    {SSL_AD_ILLEGAL_PARAMETER, "illegal_parameter"},
    {SSL_AD_UNKNOWN_CA, "unknown_ca"},
    {SSL_AD_ACCESS_DENIED, "access_denied"},
    {SSL_AD_DECODE_ERROR, "decode_error"},
    {SSL_AD_DECRYPT_ERROR, "decrypt_error"},
    {SSL_AD_EXPORT_RESTRICTION, "export_restriction"},
    {SSL_AD_PROTOCOL_VERSION, "protocol_version"},
    {SSL_AD_INSUFFICIENT_SECURITY, "insufficient_security"},
    {SSL_AD_INTERNAL_ERROR, "internal_error"},
    {SSL_AD_INAPPROPRIATE_FALLBACK, "inappropriate_fallback"},
    {SSL_AD_NO_RENEGOTIATION, "no_renegotiation"},
    {SSL_AD_MISSING_EXTENSION, "missing_extension"},
    {SSL_AD_UNSUPPORTED_EXTENSION, "unsupported_extension"},
    {SSL_AD_UNRECOGNIZED_NAME, "unrecognized_name"},
    {SSL_AD_BAD_CERTIFICATE_STATUS_RESPONSE, "bad_certificate_status_response"},
    {SSL_AD_UNKNOWN_PSK_IDENTITY, "unknown_psk_identity"},
    {SSL_AD_CERTIFICATE_REQUIRED, "certificate_required"},
    {SSL_AD_NO_APPLICATION_PROTOCOL, "no_application_protocol"},
};

// The alert of an error that OpenSSL raises for an alert from the peer, or a negative number.
int AlertOf(unsigned long error) {
  const int number = ERR_GET_REASON(error) - SSL_AD_REASON_OFFSET;
  return ERR_GET_LIB(error) == ERR_LIB_SSL && number <= 255 ? number : -1;
}

std::string AlertText(int alert) {
  const auto* const found =
      std::find_if(std::begin(kAlertNames), std::end(kAlertNames),
                   [alert](const AlertName& entry) { return entry.alert == alert; });
  return "the peer sent the alert " +
         (found == std::end(kAlertNames) ? std::to_string(alert) : std::string(found->name));
}

}  // namespace

std::string TlsErrorText(unsigned long error) {
  const char* reason = ERR_reason_error_string(error);
  const int alert = AlertOf(error);
  if (alert < 0) {
    return reason == nullptr ? "unknown cause" : reason;
  }
  return reason == nullptr ? AlertText(alert) : AlertText(alert) + " (" + reason + ")";
}

}  // namespace Tarnik::Ssl
