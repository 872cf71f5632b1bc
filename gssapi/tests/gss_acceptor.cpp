#include "gss_acceptor.h"

#include <gssapi/gssapi_ext.h>
#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "errors.h"

namespace SsoClient::Testing {

namespace {

std::string TextOf(const GssName& name) {
  GssBuffer text;
  GssStatus status;
  status.major = gss_display_name(&status.minor, name.Get(), text.Address(), nullptr);
  CheckGssStatus("The client's name cannot be read", status);
  return {static_cast<const char*>(text.Get().value), text.Get().length};
}

}  // namespace

// Uses no replay cache, which would be a file that all tests share.
GssAcceptor::GssAcceptor(const std::string& keytab) {
  gss_key_value_element_desc elements[] = {{"keytab", keytab.c_str()}, {"rcache", "none:"}};
  const gss_key_value_set_desc store{2, elements};
  GssStatus status;
  status.major =
      gss_acquire_cred_from(&status.minor, GSS_C_NO_NAME, GSS_C_INDEFINITE, GSS_C_NO_OID_SET,
                            GSS_C_ACCEPT, &store, credentials_.Address(), nullptr, nullptr);
  CheckGssStatus("The service has no keys", status);
}

std::vector<unsigned char> GssAcceptor::Accept(const std::vector<unsigned char>& leg) {
  gss_buffer_desc input{leg.size(), const_cast<unsigned char*>(leg.data())};
  GssBuffer output;
  GssName client;
  GssStatus status;
  status.major = gss_accept_sec_context(&status.minor, context_.Address(), credentials_.Get(),
                                        &input, GSS_C_NO_CHANNEL_BINDINGS, client.Address(),
                                        nullptr, output.Address(), &flags, nullptr, nullptr);
  try {
    CheckGssStatus("The service refuses", status);
  } catch (const SsoException& refusal) {
    error = refusal.Message();
  }
  isEstablished = status.major == GSS_S_COMPLETE;
  if (isEstablished) {
    clientName = TextOf(client);
  }
  const auto* bytes = static_cast<const unsigned char*>(output.Get().value);
  return {bytes, bytes + output.Get().length};
}

std::vector<unsigned char> EmptyAnswer(unsigned char state) {
  return {0xa1, 0x14, 0x30, 0x12, 0xa0, 0x03, 0x0a, 0x01, state, 0xa1, 0x0b,
          0x06, 0x09, 0x2a, 0x86, 0x48, 0x86, 0xf7, 0x12, 0x01,  0x02, 0x02};
}

void ExpectLogin(GssapiNegotiationHandler& handler, const std::string& keytab,
                 const std::string& client) {
  GssAcceptor acceptor(keytab);
  const auto first = handler.Negotiate({});
  ASSERT_NE(first, nullptr);
  EXPECT_FALSE(handler.IsEstablished());
  const auto answer = acceptor.Accept(*first);
  EXPECT_EQ(acceptor.error, "");
  EXPECT_TRUE(acceptor.isEstablished);
  EXPECT_EQ(acceptor.clientName, client);
  ASSERT_FALSE(answer.empty());

  const auto last = handler.Negotiate(answer);
  ASSERT_NE(last, nullptr);
  EXPECT_TRUE(last->empty());
  EXPECT_TRUE(handler.IsEstablished());
}

}  // namespace SsoClient::Testing
