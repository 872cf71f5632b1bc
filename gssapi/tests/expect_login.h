#ifndef SSOCLIENT_GSSAPI_TESTS_EXPECT_LOGIN_H
#define SSOCLIENT_GSSAPI_TESTS_EXPECT_LOGIN_H

#include <gtest/gtest.h>
#include <ssoclient/gssapi_negotiation_handler.h>

#include <string>

#include "gss_acceptor.h"

namespace SsoClient::Testing {

/// Negotiates with a service that has the keys of `keytab`, which is to see `client` log in.
inline void ExpectLogin(GssapiNegotiationHandler& handler, const std::string& keytab,
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

#endif
