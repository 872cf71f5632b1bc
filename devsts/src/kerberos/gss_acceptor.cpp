#include "kerberos/gss_acceptor.h"

#include <gssapi/gssapi_ext.h>
#include <gssapi/gssapi_krb5.h>

#include "kerberos/gss_library.h"

namespace DevSts {
namespace {

// iso.org.dod.internet.security.mechanism.snego (RFC 4178, section 3).
gss_OID SpnegoMechanism() {
  static char octets[] = "\x2b\x06\x01\x05\x05\x02";
  static gss_OID_desc mechanism{sizeof octets - 1, octets};
  return &mechanism;
}

GssCredentialHandle AcquireFrom(const std::string& keytab, gss_OID mechanism) {
  gss_OID_set_desc mechanisms{1, mechanism};
  gss_key_value_element_desc element{"keytab", keytab.c_str()};
  const gss_key_value_set_desc store{1, &element};
  GssCredentialHandle credential;
  OM_uint32 minor = 0;
  const OM_uint32 major =
      gss_acquire_cred_from(&minor, GSS_C_NO_NAME, GSS_C_INDEFINITE, &mechanisms, GSS_C_ACCEPT,
                            &store, credential.Address(), nullptr, nullptr);
  RequireGss(major, minor);
  return credential;
}

}  // namespace

GssAcceptor::GssAcceptor(const std::string& keytab) {
  // SPNEGO would not report why Kerberos has no credentials.
  AcquireFrom(keytab, gss_mech_krb5);
  credential_ = AcquireFrom(keytab, SpnegoMechanism());
  OM_uint32 minor = 0;
  gss_OID_set_desc kerberos{1, gss_mech_krb5};
  const OM_uint32 major = gss_set_neg_mechs(&minor, credential_.Get(), &kerberos);
  RequireGss(major, minor);
}

Octets GssLogin::Take(const Octets& leg) {
  gss_buffer_desc input = AsGss(leg);
  GssBuffer output;
  GssNameHandle client;
  OM_uint32 minor = 0;
  const OM_uint32 major = gss_accept_sec_context(
      &minor, context_.Address(), acceptor_->Credential(), &input, GSS_C_NO_CHANNEL_BINDINGS,
      client.Address(), nullptr, output.Address(), nullptr, nullptr, nullptr);
  RequireGss(major, minor);
  done_ = (major & GSS_S_CONTINUE_NEEDED) == 0;
  if (done_) {
    client_ = std::move(client);
  }
  return output.Copy();
}

std::string GssLogin::Principal() const {
  GssBuffer name;
  OM_uint32 minor = 0;
  const OM_uint32 major = gss_display_name(&minor, client_.Get(), name.Address(), nullptr);
  RequireGss(major, minor);
  const Octets octets = name.Copy();
  return {octets.begin(), octets.end()};
}

void GssLogin::VerifyMic(const Octets& message, const Octets& mic) const {
  gss_buffer_desc input = AsGss(message);
  gss_buffer_desc token = AsGss(mic);
  OM_uint32 minor = 0;
  const OM_uint32 major = gss_verify_mic(&minor, context_.Get(), &input, &token, nullptr);
  RequireGss(major, minor);
}

Octets GssLogin::MicOf(const Octets& message) const {
  gss_buffer_desc input = AsGss(message);
  GssBuffer mic;
  OM_uint32 minor = 0;
  const OM_uint32 major =
      gss_get_mic(&minor, context_.Get(), GSS_C_QOP_DEFAULT, &input, mic.Address());
  RequireGss(major, minor);
  return mic.Copy();
}

}  // namespace DevSts
