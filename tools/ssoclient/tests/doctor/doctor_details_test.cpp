// The members of the details of each step: programs depend on their names.
#include <array>
#include <ctime>
#include <map>
#include <set>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>
#include <sys/stat.h>

#include "devsts/server.h"
#include "support/doctor_run.h"
#include "support/findings_page.h"
#include "support/temporary_file.h"

namespace SsoClient::Tool::Testing {
namespace {

using Tarnik::Testing::TemporaryFile;
using Names = std::set<std::string>;

// The names of all members of the value, in the form of the page.
void AddNames(const nlohmann::json& value, const std::string& name, Names& names) {
  if (value.is_object()) {
    for (const auto& [member, inner] : value.items()) {
      AddNames(inner, name.empty() ? member : name + "." + member, names);
    }
  } else if (value.is_array() && !value.empty()) {
    for (const nlohmann::json& each : value) {
      AddNames(each, name + "[]", names);
    }
  } else {
    names.insert(value.is_array() ? name + "[]" : name);
  }
}

// By step, without those that have no details.
std::map<std::string, Names> NamesOfDetails(const DoctorRun& run) {
  std::map<std::string, Names> all;
  for (const std::string& step : run.Steps()) {
    AddNames(nlohmann::json::parse(run.Detail(step, "")), "", all[step]);
    if (all[step].empty()) {
      all.erase(step);
    }
  }
  return all;
}

std::string DateOfNow() {
  const std::time_t now = std::time(nullptr);
  std::tm fields{};
  gmtime_r(&now, &fields);
  std::array<char, 40> date{};
  std::strftime(date.data(), date.size(), "%a, %d %b %Y %H:%M:%S GMT", &fields);
  return date.data();
}

// A login with everything that a service can send.
DoctorRun RunCompleteLogin() {
  DevSts::Server sts;
  const DevSts::Credential client = sts.MakeClientCredential("bob");
  sts.RegisterCertificate("bob@EXAMPLE.COM", client.certificatePem);
  DevSts::Misbehavior talkative;
  talkative.extraHeaders = {{"Date", DateOfNow()}, {"Server", "sts/1"}, {"Location", "/elsewhere"}};
  sts.SetMisbehavior(talkative);
  const TemporaryFile ca(sts.CaCertificatePem());
  const TemporaryFile signer(sts.SigningCertificatePem());
  const TemporaryFile certificate(client.certificatePem);
  const TemporaryFile key(client.privateKeyPem);
  chmod(key.Path().c_str(), S_IRUSR | S_IWUSR);
  return RunDoctor(sts.HttpsUrl(), {"--ca", ca.Path(), "--sts-certificate", signer.Path(),
                                    "--certificate", certificate.Path(), "--key", key.Path()});
}

// The service refuses the versions of TLS.
DoctorRun RunWithAlert() {
  DevSts::ServerOptions options;
  options.tls.protocol = DevSts::TlsProtocol::Tls11Only;
  const DevSts::Server sts(options);
  const TemporaryFile ca(sts.CaCertificatePem());
  return RunDoctor(sts.HttpsUrl(), {"--ca", ca.Path()});
}

// The library does not trust the service.
DoctorRun RunWithoutTrust() {
  const DevSts::Server sts;
  const TemporaryFile other(sts.StrangerCredential().certificatePem);
  return RunDoctor(sts.HttpsUrl(), {"--ca", other.Path()});
}

TEST(DoctorDetailsTest, TheNamesAreThoseOfThePage) {
  const DoctorRun complete = RunCompleteLogin();
  EXPECT_EQ(complete.Status(), 0) << complete.Text();
  std::map<std::string, Names> documented = DocumentedDetails();
  EXPECT_EQ(documented["tls"].erase("alert"), 1U);
  EXPECT_EQ(documented["certificate"].erase("libraryMessage"), 1U);
  EXPECT_EQ(NamesOfDetails(complete), documented);

  EXPECT_EQ(NamesOfDetails(RunWithAlert())["tls"], Names{"alert"});
  Names refused = documented["certificate"];
  refused.insert("libraryMessage");
  EXPECT_EQ(NamesOfDetails(RunWithoutTrust())["certificate"], refused);
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
