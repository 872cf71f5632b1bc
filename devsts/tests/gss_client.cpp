#include "gss_client.h"

#include <stdexcept>

#include <gssapi/gssapi_ext.h>
#include <gssapi/gssapi_krb5.h>

#include "kerberos/spnego_token.h"

namespace DevSts::Testing {
namespace {

gss_OID SpnegoMechanism() {
  static char octets[] = "\x2b\x06\x01\x05\x05\x02";
  static gss_OID_desc mechanism{sizeof octets - 1, octets};
  return &mechanism;
}

void Require(OM_uint32 major, const char* what) {
  if (GSS_ERROR(major) != 0) {
    throw std::runtime_error(std::string("the client's ") + what + " failed");
  }
}

gss_buffer_desc AsBuffer(const std::string& text) {
  return {text.size(), const_cast<char*>(text.data())};
}

gss_buffer_desc AsBuffer(const Octets& octets) {
  return {octets.size(), const_cast<unsigned char*>(octets.data())};
}

Octets ToOctets(const std::string& text) {
  return {text.begin(), text.end()};
}

}  // namespace

class GssClient::State {
 public:
  explicit State(OM_uint32 wanted) : flags(wanted) {}
  ~State() {
    OM_uint32 ignored = 0;
    gss_delete_sec_context(&ignored, &context, GSS_C_NO_BUFFER);
    gss_release_name(&ignored, &target);
    gss_release_cred(&ignored, &credential);
  }
  State(const State&) = delete;
  State& operator=(const State&) = delete;

  const OM_uint32 flags;
  gss_cred_id_t credential = GSS_C_NO_CREDENTIAL;
  gss_name_t target = GSS_C_NO_NAME;
  gss_ctx_id_t context = GSS_C_NO_CONTEXT;
  std::string firstLeg;
  bool isDone = false;

  // The leg that answers the service's signature of the list of mechanisms (RFC 4178, section 5),
  // empty if the service's leg has none.
  std::string SignMechanisms(const std::string& serverLeg) {
    const Octets mic = MicIn(ToOctets(serverLeg));
    if (mic.empty()) {
      return {};
    }
    const Octets mechTypes = MechTypesIn(ToOctets(firstLeg));
    gss_buffer_desc message = AsBuffer(mechTypes);
    gss_buffer_desc received = AsBuffer(mic);
    gss_buffer_desc own = GSS_C_EMPTY_BUFFER;
    OM_uint32 minor = 0;
    Require(gss_verify_mic(&minor, context, &message, &received, nullptr), "check");
    Require(gss_get_mic(&minor, context, GSS_C_QOP_DEFAULT, &message, &own), "signature");
    const auto* const bytes = static_cast<const unsigned char*>(own.value);
    const Octets signature(bytes, bytes + own.length);
    gss_release_buffer(&minor, &own);
    const Octets leg =
        WithMic(WriteResponse(NegState::AcceptCompleted), NegState::AcceptCompleted, signature);
    return {leg.begin(), leg.end()};
  }
};

GssClient::GssClient(const std::string& cache, const std::string& service, OM_uint32 flags)
    : state_(std::make_unique<State>(flags)) {
  OM_uint32 minor = 0;
  gss_buffer_desc name = AsBuffer(service);
  Require(gss_import_name(&minor, &name, GSS_KRB5_NT_PRINCIPAL_NAME, &state_->target), "name");
  gss_OID_set_desc mechanisms{1, SpnegoMechanism()};
  gss_key_value_element_desc element{"ccache", cache.c_str()};
  const gss_key_value_set_desc store{1, &element};
  Require(gss_acquire_cred_from(&minor, GSS_C_NO_NAME, GSS_C_INDEFINITE, &mechanisms,
                                GSS_C_INITIATE, &store, &state_->credential, nullptr, nullptr),
          "credential");
}

GssClient::~GssClient() = default;

std::string GssClient::Step(const std::string& serverLeg) {
  gss_buffer_desc input = AsBuffer(serverLeg);
  gss_buffer_desc output = GSS_C_EMPTY_BUFFER;
  OM_uint32 minor = 0;
  const OM_uint32 major = gss_init_sec_context(
      &minor, state_->credential, &state_->context, state_->target, SpnegoMechanism(),
      state_->flags, 0, GSS_C_NO_CHANNEL_BINDINGS, &input, nullptr, &output, nullptr, nullptr);
  std::string leg(static_cast<const char*>(output.value), output.length);
  gss_release_buffer(&minor, &output);
  Require(major, "leg");
  state_->isDone = major == GSS_S_COMPLETE;
  if (serverLeg.empty()) {
    state_->firstLeg = leg;
  }
  // MIT Kerberos 1.21 overlooks the service's signature.
  const bool isUnsigned = state_->isDone && leg.empty() && !serverLeg.empty();
  return isUnsigned ? state_->SignMechanisms(serverLeg) : leg;
}

bool GssClient::IsDone() const {
  return state_->isDone;
}

}  // namespace DevSts::Testing
