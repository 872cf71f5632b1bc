#ifndef DEVSTS_NEGOTIATION_FIXTURE_H
#define DEVSTS_NEGOTIATION_FIXTURE_H

#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "devsts/kerberos_realm.h"
#include "devsts/server.h"
#include "gss_client.h"
#include "negotiation_client.h"

namespace DevSts::Testing {

// A realm with users who have logged in, and the keytab of a service. Changes the environment only
// while there is no other thread.
class NegotiationFixture : public testing::Test {
 protected:
  static constexpr char kService[] = "HTTP/localhost@EXAMPLE.COM";

  static void SetUpTestSuite();
  static void TearDownTestSuite();

  static ServerOptions Options();

  static std::unique_ptr<KerberosRealm> realm;
  static std::string keytab;
  static std::string alice;  // credential caches
  static std::string bob;
  static std::string carol;  // not a user of the service
};

}  // namespace DevSts::Testing

#endif
