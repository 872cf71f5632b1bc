// Findings of the pure functions, at their limits.
#include <cerrno>
#include <cstddef>
#include <string>

#include <gtest/gtest.h>
#include <openssl/x509_vfy.h>

#include "doctor/chain.h"
#include "doctor/clock.h"
#include "doctor/report.h"
#include "doctor/tcp_findings.h"
#include "doctor/tls_findings.h"
#include "doctor/token_findings.h"

namespace SsoClient::Tool::Doctor {
namespace {

using Tarnik::System::DateTime;

TEST(TcpFindingsTest, OneAddressThatAcceptsIsEnough) {
  EXPECT_EQ(FindingOfConnections({{0, false}}, 443).name, "ok");
  // A machine without IPv6 always fails to reach these addresses.
  EXPECT_EQ(FindingOfConnections({{ENETUNREACH, true}, {0, false}}, 443).name, "ok");
  const Finding some = FindingOfConnections({{0, false}, {ECONNREFUSED, false}}, 443);
  EXPECT_EQ(some.name, "some-addresses-fail");
  EXPECT_EQ(some.outcome, StepOutcome::kWarning);
  EXPECT_EQ(some.message, "port 443 accepts connections at 1 of 2 addresses");
  EXPECT_EQ(FindingOfConnections({{0, false}}, 443).message,
            "port 443 accepts connections at 1 of 1 address");
}

TEST(TcpFindingsTest, TheErrorThatSaysMostCounts) {
  EXPECT_EQ(FindingOfConnections({{ENETUNREACH, true}, {ECONNREFUSED, false}}, 443).name,
            "refused");
  EXPECT_EQ(FindingOfConnections({{ENETUNREACH, true}, {ENETUNREACH, false}}, 443).name,
            "network-unreachable");
  EXPECT_EQ(FindingOfConnections({{ENETUNREACH, true}}, 443).name, "only-ipv6");
  EXPECT_EQ(FindingOfConnections({{EHOSTUNREACH, false}}, 443).name, "host-unreachable");
  EXPECT_EQ(FindingOfConnections({{EMFILE, false}}, 443).name, "tcp-failed");
}

TEST(TlsFindingsTest, ASecondConnectionThatIsRefusedIsFound) {
  TlsFacts facts;
  facts.isConnected = false;
  EXPECT_EQ(FindingOfTls(facts, 443).name, "tls-no-connection");
}

TEST(TlsFindingsTest, AlertsHaveTheirNames) {
  EXPECT_EQ(AlertName(70), "protocol_version");
  EXPECT_EQ(AlertName(250), "250");
}

std::string ChainFinding(int error, bool isSelfIssued = false) {
  ChainFacts facts;
  ChainLink link;
  link.notAfter = DateTime::Parse("2030-01-01T00:00:00Z");
  link.isSelfIssued = isSelfIssued;
  facts.links = {link};
  facts.errors = {error};
  return FindingOfChain(facts, DateTime::Parse("2026-01-01T00:00:00Z")).name;
}

TEST(ChainFindingsTest, EachErrorOfTheVerificationHasItsFinding) {
  EXPECT_EQ(ChainFinding(X509_V_ERR_CERT_REVOKED), "revoked");
  EXPECT_EQ(ChainFinding(X509_V_ERR_UNABLE_TO_GET_CRL), "revocation-unknown");
  EXPECT_EQ(ChainFinding(X509_V_ERR_CRL_HAS_EXPIRED), "revocation-unknown");
  EXPECT_EQ(ChainFinding(X509_V_ERR_INVALID_PURPOSE), "not-trusted");
  EXPECT_EQ(ChainFinding(X509_V_ERR_EE_KEY_TOO_SMALL), "not-trusted");
  // A CA of this machine that has expired; the chain of the service is current.
  EXPECT_EQ(ChainFinding(X509_V_ERR_CERT_HAS_EXPIRED), "expired");
}

TEST(ChainFindingsTest, ACertificateNeedsAttentionThirtyDaysBeforeItsEnd) {
  ChainFacts facts;
  ChainLink link;
  link.notAfter = DateTime::Parse("2026-01-31T00:00:00Z");
  facts.links = {link};
  EXPECT_EQ(FindingOfChain(facts, DateTime::Parse("2026-01-01T00:00:00Z")).name, "ok");
  EXPECT_EQ(FindingOfChain(facts, DateTime::Parse("2026-01-01T00:00:01Z")).name, "expires-soon");
}

TEST(ChainFindingsTest, ACertificateThatExpiresIsRenewedByItsOwner) {
  ChainFacts facts;
  facts.links.resize(3);
  for (ChainLink& link : facts.links) {
    link.notAfter = DateTime::Parse("2030-01-01T00:00:00Z");
  }
  facts.links.back().isSelfIssued = true;
  const std::string remedies[] = {
      "have the certificate of the service renewed",
      "get the next certificate of the CA, and let the service send it",
      "get the next certificate of the CA from a trusted source, and give it as --ca too"};
  for (std::size_t i = 0; i < facts.links.size(); ++i) {
    ChainFacts soon = facts;
    soon.links[i].notAfter = DateTime::Parse("2026-01-02T12:00:00Z");
    const Finding finding = FindingOfChain(soon, DateTime::Parse("2026-01-01T00:00:00Z"));
    EXPECT_EQ(finding.name, "expires-soon");
    EXPECT_EQ(finding.remedy, remedies[i]);
    EXPECT_NE(finding.message.find(" expires in 1 day, on "), std::string::npos);
    soon.errors = {X509_V_ERR_CERT_HAS_EXPIRED};
    const Finding past = FindingOfChain(soon, DateTime::Parse("2026-02-01T00:00:00Z"));
    EXPECT_EQ(past.name, "expired");
    EXPECT_EQ(past.remedy, remedies[i] + ", unless the clock of this machine is wrong");
  }
}

TEST(ClockTest, TheMiddleOfTheRoundTripIsCompared) {
  const ClockOffset offset = OffsetOf(1000, 900'000'000, 904'000'000);
  EXPECT_DOUBLE_EQ(offset.seconds, 98.5);  // the Date does not show half a second on average
  EXPECT_DOUBLE_EQ(offset.uncertainty, 2.5);
}

TEST(ClockTest, OnlyACertainDifferenceIsAProblem) {
  EXPECT_EQ(FindingOfClock({31, 0.5}).name, "clock-off");
  EXPECT_EQ(FindingOfClock({31, 2}).name, "ok");
  EXPECT_EQ(FindingOfClock({-601, 0.5}).name, "clock-far-off");
  EXPECT_EQ(FindingOfClock({-601, 2}).name, "clock-off");
}

TEST(TokenFindingsTest, AValidityThatIsNotNowIsAWarning) {
  const DateTime start = DateTime::Parse("2026-01-01T00:00:00Z");
  const DateTime end = DateTime::Parse("2026-01-01T00:05:00Z");
  const auto name = [&](const char* now) {
    return FindingOfValidity(start, end, DateTime::Parse(now)).name;
  };
  EXPECT_EQ(name("2025-12-31T23:59:56Z"), "ok");
  EXPECT_EQ(name("2025-12-31T23:59:54Z"), "token-not-yet-valid");
  EXPECT_EQ(name("2026-01-01T00:04:59Z"), "ok");
  EXPECT_EQ(name("2026-01-01T00:05:00Z"), "token-already-expired");
}

TEST(ReportTest, TheFirstFailureIsTheCauseAndElseTheFirstWarning) {
  Report report;
  report.steps.resize(3);
  EXPECT_EQ(FirstCause(report), nullptr);
  EXPECT_EQ(StatusOf(report, true), ExitStatus::kDone);
  report.steps[0].finding = Warning(ExitStatus::kLocal, "expires-soon", "", "");
  EXPECT_EQ(FirstCause(report), &report.steps[0]);
  EXPECT_EQ(StatusOf(report, false), ExitStatus::kDone);
  EXPECT_EQ(StatusOf(report, true), ExitStatus::kLocal);
  report.steps[2].finding = Failure(ExitStatus::kRefused, "login-refused", "", "");
  EXPECT_EQ(FirstCause(report), &report.steps[2]);
  EXPECT_EQ(StatusOf(report, false), ExitStatus::kRefused);
}

}  // namespace
}  // namespace SsoClient::Tool::Doctor
