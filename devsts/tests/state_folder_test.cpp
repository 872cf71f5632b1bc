#include "state_folder.h"

#include <chrono>
#include <cstdio>
#include <stdexcept>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "devsts/certificates.h"
#include "errors.h"
#include "program_process.h"
#include "revocations.h"

namespace DevSts::Testing {
namespace {

using Program::FileError;
using Program::KeyPlan;
using Program::Keys;
using Program::Revocations;
using Program::StateFolder;
using testing::HasSubstr;

Keys Start(const std::string& path, const KeyPlan& plan = {}) {
  return StateFolder(path).LoadOrMake(plan);
}

KeyPlan ByAuthority() {
  KeyPlan plan;
  plan.signingByAuthority = true;
  return plan;
}

// Why a start with the folder fails.
std::string Refusal(const std::string& path, const KeyPlan& plan = {}) {
  try {
    Start(path, plan);
  } catch (const FileError& error) {
    return error.what();
  }
  return "accepted";
}

class StateFolderTest : public testing::Test {
 protected:
  void Replace(const std::string& name, const Credential& credential) const {
    WriteTextTo(state + "/" + name + ".pem", credential.certificatePem);
    WriteTextTo(state + "/" + name + "-key.pem", credential.privateKeyPem);
  }

  // Whether the list in the folder names the certificate.
  bool IsRevoked(const Keys& keys, const Credential& credential) const {
    return Program::IsRevokedBy(TextOfFile(state + "/ca.crl"), credential.certificatePem,
                                keys.authority.certificatePem);
  }

  ScratchFolder scratch;
  const std::string state = scratch / "deep/state";
};

TEST_F(StateFolderTest, KeepsTheKeysFromOneStartToTheNext) {
  const Keys first = Start(state);
  const Keys second = Start(state);
  EXPECT_EQ(first.authority.certificatePem, second.authority.certificatePem);
  EXPECT_EQ(first.server.privateKeyPem, second.server.privateKeyPem);
  EXPECT_EQ(first.signing.privateKeyPem, second.signing.privateKeyPem);
  EXPECT_EQ(first.client.certificatePem, second.client.certificatePem);
  EXPECT_NE(Start(scratch / "other").signing.privateKeyPem, first.signing.privateKeyPem);
}

TEST_F(StateFolderTest, OnlyTheOwnerReadsKeys) {
  Start(state);
  for (const char* name : {"ca", "server", "signing", "client"}) {
    EXPECT_EQ(ModeOf(state + "/" + name + "-key.pem"), 0600U) << name;
    EXPECT_EQ(ModeOf(state + "/" + name + ".pem"), 0644U) << name;
  }
  ASSERT_EQ(chmod((state + "/signing-key.pem").c_str(), 0640), 0);
  EXPECT_THAT(Refusal(state), HasSubstr("signing-key.pem: others have access"));
}

TEST_F(StateFolderTest, IsUsedByOneProcessAtATime) {
  const StateFolder folder(state);
  EXPECT_THAT(Refusal(state), HasSubstr("another process uses this folder"));
}

TEST_F(StateFolderTest, NeverReplacesAMissingFile) {
  Start(state);
  for (const char* name : {"ca.pem", "ca-key.pem", "server.pem", "signing-key.pem", "client.pem"}) {
    const std::string path = state + "/" + name;
    const std::string text = TextOfFile(path);
    ASSERT_EQ(std::remove(path.c_str()), 0);
    EXPECT_THAT(Refusal(state), HasSubstr(std::string(name) + ": the file is missing"));
    EXPECT_FALSE(FileExists(path));
    WriteTextTo(path, text);
    ASSERT_EQ(chmod(path.c_str(), 0600), 0);
  }
  EXPECT_EQ(Refusal(state), "accepted");
}

TEST_F(StateFolderTest, RefusesBrokenFiles) {
  Start(state);
  for (const char* name : {"ca.pem", "server-key.pem", "signing.pem", "client-key.pem"}) {
    const std::string path = state + "/" + name;
    const std::string text = TextOfFile(path);
    for (const std::string& broken : {std::string(), text.substr(0, text.size() / 2)}) {
      WriteTextTo(path, broken);
      EXPECT_THAT(Refusal(state), HasSubstr(name));
      EXPECT_EQ(TextOfFile(path), broken) << "The file is left as it is";
    }
    WriteTextTo(path, text);
  }
  EXPECT_EQ(Refusal(state), "accepted");
}

TEST_F(StateFolderTest, RefusesLinksInPlaceOfItsFiles) {
  const Keys keys = Start(state, ByAuthority());
  Revocations(keys, state).WriteTo(state);
  for (const char* name : {"lock", "ca.pem", "server-key.pem"}) {
    const std::string path = state + "/" + name;
    const std::string moved = scratch / name;
    ASSERT_EQ(std::rename(path.c_str(), moved.c_str()), 0);
    ASSERT_EQ(symlink(moved.c_str(), path.c_str()), 0);
    EXPECT_THAT(Refusal(state, ByAuthority()), HasSubstr(std::string(name) + ": cannot be "));
    ASSERT_EQ(std::rename(moved.c_str(), path.c_str()), 0);
    EXPECT_EQ(Refusal(state, ByAuthority()), "accepted");
  }
  ASSERT_EQ(std::rename((state + "/ca.crl").c_str(), (scratch / "ca.crl").c_str()), 0);
  ASSERT_EQ(symlink((scratch / "ca.crl").c_str(), (state + "/ca.crl").c_str()), 0);
  EXPECT_THROW(Revocations(keys, state), FileError);
}

TEST_F(StateFolderTest, RefusesFilesThatAreNotRegular) {
  Start(state);
  const std::string path = state + "/ca.pem";
  ASSERT_EQ(std::remove(path.c_str()), 0);
  ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
  EXPECT_THAT(Refusal(state), HasSubstr("ca.pem: this is not a regular file"));
}

TEST_F(StateFolderTest, RefusesExpiredCertificates) {
  const Keys keys = Start(state);
  CertificateSpec spec;
  spec.commonName = "Dev STS server";
  spec.notAfter = std::chrono::seconds(-1);
  Replace("server", MakeCertificate(spec, &keys.authority));
  EXPECT_THAT(Refusal(state), HasSubstr("server.pem: the certificate has expired"));
  spec.notAfter = std::chrono::hours(2);
  spec.notBefore = std::chrono::hours(1);
  Replace("server", MakeCertificate(spec, &keys.authority));
  EXPECT_THAT(Refusal(state), HasSubstr("server.pem: the certificate is not valid yet"));
}

TEST_F(StateFolderTest, RefusesFilesThatDoNotFitEachOther) {
  const Keys keys = Start(state);
  const Keys other = Start(scratch / "other");
  Replace("client", {keys.client.certificatePem, other.client.privateKeyPem});
  EXPECT_THAT(Refusal(state), HasSubstr("client-key.pem: the key does not belong"));
  Replace("client", other.client);
  EXPECT_THAT(Refusal(state), HasSubstr("client.pem: the certificate was not issued by ca.pem"));
  Replace("client", keys.client);
  EXPECT_EQ(Refusal(state), "accepted");
}

TEST_F(StateFolderTest, RefusesASigningKeyThatTheOptionsDoNotAllow) {
  Start(state);
  EXPECT_THAT(Refusal(state, ByAuthority()), HasSubstr("--signing-by-ca requires"));
  KeyPlan plan;
  plan.signingKey = KeyType::EcP256;
  EXPECT_THAT(Refusal(state, plan), HasSubstr("signing-key.pem: the key is not of the type"));
}

TEST_F(StateFolderTest, RevocationsStay) {
  const Keys keys = Start(state, ByAuthority());
  Revocations first(keys, state);
  first.WriteTo(state);
  EXPECT_FALSE(IsRevoked(keys, keys.signing));
  first.Revoke("signing");
  EXPECT_TRUE(IsRevoked(keys, keys.signing));
  EXPECT_FALSE(IsRevoked(keys, keys.server));

  Revocations second(keys, state);
  second.WriteTo(state);
  second.Revoke("client");
  EXPECT_TRUE(IsRevoked(keys, keys.signing));
  EXPECT_TRUE(IsRevoked(keys, keys.client));
}

TEST_F(StateFolderTest, RevokesNothingIfTheListCannotBeWritten) {
  const Keys keys = Start(state, ByAuthority());
  const std::string path = state + "/ca.crl";
  Revocations revocations(keys, state);
  revocations.WriteTo(state);
  ASSERT_EQ(std::remove(path.c_str()), 0);
  ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
  EXPECT_THROW(revocations.Revoke("signing"), FileError);
  ASSERT_EQ(std::remove(path.c_str()), 0);
  revocations.Revoke("client");
  EXPECT_FALSE(IsRevoked(keys, keys.signing));
  EXPECT_TRUE(IsRevoked(keys, keys.client));
}

TEST_F(StateFolderTest, RefusesARevocationListOfAnotherAuthority) {
  const Keys keys = Start(state, ByAuthority());
  const Keys other = Start(scratch / "other", ByAuthority());
  WriteTextTo(state + "/ca.crl", MakeRevocationList(other.authority, {}));
  EXPECT_THROW(Revocations(keys, state), FileError);
  WriteTextTo(state + "/ca.crl", "broken");
  EXPECT_THROW(Revocations(keys, state), FileError);
  WriteTextTo(state + "/ca.crl", MakeRevocationList(keys.authority, {}));
  EXPECT_NO_THROW(Revocations(keys, state));
}

TEST_F(StateFolderTest, RevokesOnlyWhatTheAuthorityHasIssued) {
  Revocations revocations(Start(state), "");
  EXPECT_THROW(revocations.Revoke("signing"), std::invalid_argument);
  EXPECT_THROW(revocations.Revoke("server"), std::invalid_argument) << "no folder";
  revocations.WriteTo(state);
  EXPECT_NO_THROW(revocations.Revoke("server"));
}

}  // namespace
}  // namespace DevSts::Testing
