// Findings about local files, each produced for real.
#include <chrono>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "devsts/certificates.h"
#include "support/doctor_run.h"
#include "support/temporary_file.h"

namespace SsoClient::Tool::Testing {
namespace {

using DevSts::CertificateSpec;
using DevSts::Credential;
using Tarnik::Testing::TemporaryFile;
using testing::HasSubstr;

// The system never connects to it, so that only the files are examined.
constexpr const char* kUrl = "https://[ff02::1]/sts";

Credential Make(long fromDays, long toDays, bool freshKey = false) {
  CertificateSpec spec;
  spec.commonName = "local";
  spec.keyType = DevSts::KeyType::Rsa2048;
  spec.freshKey = freshKey;
  spec.notBefore = std::chrono::hours(24 * fromDays);
  spec.notAfter = std::chrono::hours(24 * toDays);
  return DevSts::MakeCertificate(spec);
}

DoctorRun RunIdentity(const std::string& certificate, const std::string& key) {
  const TemporaryFile certificateFile(certificate);
  const TemporaryFile keyFile(key);
  chmod(keyFile.Path().c_str(), S_IRUSR | S_IWUSR);
  return RunDoctor(kUrl, {"--certificate", certificateFile.Path(), "--key", keyFile.Path()});
}

TEST(DoctorFilesTest, MissingAndUnusableFilesOfTrustAreFound) {
  const TemporaryFile rubbish("rubbish");
  ExpectFailure(RunDoctor(kUrl, {"--ca", "/nonexistent"}), "trust", "file-missing", 4,
                "certificate");
  ExpectFailure(RunDoctor(kUrl, {"--ca", "/"}), "trust", "file-missing", 4, "certificate");
  ExpectFailure(RunDoctor(kUrl, {"--ca", rubbish.Path()}), "trust", "bad-ca-file", 4,
                "certificate");
  ExpectFailure(RunDoctor(kUrl, {"--tls-crl", rubbish.Path()}), "trust", "bad-revocation-list", 4,
                "certificate");
  ExpectFailure(RunDoctor(kUrl, {"--sts-certificate", rubbish.Path()}), "trust",
                "bad-sts-certificate", 4, "certificate");
}

TEST(DoctorFilesTest, AFileThatThisUserMayNotReadIsFound) {
  const TemporaryFile file(Make(-1, 90).certificatePem);
  chmod(file.Path().c_str(), 0);
  ToolOptions options;
  options.arguments = {"doctor", "--json", "--url", kUrl, "--ca", file.Path()};
  options.prepare = [] {
    constexpr uid_t kNobody = 65534;  // root may read everything
    static_cast<void>(geteuid() == 0 && setuid(kNobody) == 0);
  };
  ExpectFailure(DoctorRun(options), "trust", "file-unreadable", 4, "certificate");
}

TEST(DoctorFilesTest, CertificatesOfTrustThatExpireAreWarnings) {
  const std::pair<Credential, const char*> cases[] = {
      {Make(-30, -1), "local-certificate-expired"},
      {Make(1, 90), "local-certificate-not-yet-valid"},
      {Make(-1, 5), "local-certificate-expires-soon"},
  };
  for (const auto& [credential, finding] : cases) {
    const TemporaryFile file(credential.certificatePem);
    ExpectWarning(RunDoctor(kUrl, {"--ca", file.Path()}), "trust", finding);
    ExpectWarning(RunDoctor(kUrl, {"--sts-certificate", file.Path()}), "trust", finding);
  }
}

TEST(DoctorFilesTest, ACertificateThatExpiresSoonHasTheRemedyOfItsUse) {
  const Credential soon = Make(-1, 2);
  const TemporaryFile file(soon.certificatePem);
  const DoctorRun ca = RunDoctor(kUrl, {"--ca", file.Path()});
  EXPECT_THAT(ca.Message("trust"), HasSubstr(" expires in 1 day, on "));
  EXPECT_THAT(ca.Remedy("trust"), HasSubstr("next certificate of the CA"));
  EXPECT_THAT(RunDoctor(kUrl, {"--sts-certificate", file.Path()}).Remedy("trust"),
              HasSubstr("next signing certificate"));
  EXPECT_EQ(RunIdentity(soon.certificatePem, soon.privateKeyPem).Remedy("credentials"),
            "have it renewed");
}

TEST(DoctorFilesTest, TrustedFilesAreCounted) {
  const TemporaryFile file(Make(-1, 90).certificatePem);
  EXPECT_EQ(RunDoctor(kUrl, {"--ca", file.Path()}).Message("trust"), "1 CA file trusted");
  EXPECT_EQ(RunDoctor(kUrl, {"--ca", file.Path(), "--ca", file.Path()}).Message("trust"),
            "2 CA files trusted");
}

TEST(DoctorFilesTest, AKeyMustBelongToItsCertificate) {
  const Credential one = Make(-1, 90);
  const Credential other = Make(-1, 90, true);
  const DoctorRun good = RunIdentity(one.certificatePem, one.privateKeyPem);
  EXPECT_EQ(good.Finding("credentials"), "ok") << good.Text();
  ExpectFailure(RunIdentity(one.certificatePem, other.privateKeyPem), "credentials", "key-mismatch",
                4, "login");
}

TEST(DoctorFilesTest, UnusableFilesOfTheLoginAreFound) {
  const Credential one = Make(-1, 90);
  ExpectFailure(RunIdentity("rubbish", one.privateKeyPem), "credentials", "bad-certificate-file", 4,
                "login");
  ExpectFailure(RunIdentity(one.certificatePem, "rubbish"), "credentials", "bad-key-file", 4,
                "login");
  const TemporaryFile certificate(one.certificatePem);
  ExpectFailure(RunDoctor(kUrl, {"--certificate", certificate.Path(), "--key", "/nonexistent"}),
                "credentials", "file-missing", 4, "login");
}

TEST(DoctorFilesTest, TheValidityOfTheLoginsCertificateIsExamined) {
  const Credential expired = Make(-30, -1);
  const Credential future = Make(1, 90);
  const Credential soon = Make(-1, 5);
  ExpectFailure(RunIdentity(expired.certificatePem, expired.privateKeyPem), "credentials",
                "local-certificate-expired", 4, "login");
  ExpectFailure(RunIdentity(future.certificatePem, future.privateKeyPem), "credentials",
                "local-certificate-not-yet-valid", 4, "login");
  ExpectWarning(RunIdentity(soon.certificatePem, soon.privateKeyPem), "credentials",
                "local-certificate-expires-soon");
}

TEST(DoctorFilesTest, OptionsThatExcludeEachOtherAreWrong) {
  const std::vector<std::vector<std::string>> wrong = {
      {"doctor", "--url", kUrl, "--user", "a", "--kerberos"},
      {"doctor", "--url", kUrl, "--user", "a", "--certificate", "a"},
      {"doctor", "--url", kUrl, "--kerberos", "--certificate", "a"},
      {"doctor", "--url", kUrl, "--key", "a"},
      {"doctor", "--url", kUrl, "--keytab", "a"},
      {"doctor", "--url", kUrl, "--ccache", "a"},
      {"doctor"},
  };
  for (const std::vector<std::string>& arguments : wrong) {
    EXPECT_EQ(RunTool(arguments).status, 2) << arguments.back();
  }
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
