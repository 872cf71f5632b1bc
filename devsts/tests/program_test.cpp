#include <chrono>
#include <cstdlib>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <openssl/x509_vfy.h>
#include <poll.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <time.h>
#include <unistd.h>

#include "descriptor.h"
#include "devsts/xml_security.h"
#include "help_texts.h"
#include "program_process.h"
#include "raw_client.h"
#include "request_text.h"

namespace DevSts::Testing {
namespace {

using Program::Descriptor;
using testing::AllOf;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

std::string AskAt(const std::string& url, const std::string& envelope = AliceEnvelope()) {
  RawClient client(PortIn(url));
  client.Send(PostOf(envelope, kIssueAction));
  return client.ReadAnswer();
}

// Runs the control client.
std::string Control(const std::string& path, std::vector<std::string> command) {
  command.insert(command.begin(), {"control", path});
  const ProgramResult result = RunProgram(command);
  return std::to_string(result.status) + " " + result.output + result.errors;
}

// Waits for the end of a process that is not a child; closes its descriptor.
void AwaitEnd(int processDescriptor) {
  pollfd entry{processDescriptor, POLLIN, 0};
  EXPECT_EQ(poll(&entry, 1, 30'000), 1) << "The process still runs";
  close(processDescriptor);
}

TEST(ProgramTest, SaysWhenItIsReadyAndEndsOnSignals) {
  for (const int signal : {SIGTERM, SIGINT}) {
    ProgramProcess program({});
    program.AwaitReady();
    EXPECT_THAT(program.Output(), StartsWith("http_url=http://127.0.0.1:"));
    EXPECT_THAT(AskAt(program.Value("http_url")), StartsWith("HTTP/1.1 200 "));
    EXPECT_THAT(program.ReadLine(), AllOf(StartsWith("request connection=1 "),
                                          HasSubstr(" status=200"), Not(HasSubstr("secret"))));
    program.Signal(signal);
    EXPECT_EQ(program.WaitForEnd(), 0);
    EXPECT_THAT(program.Errors(), HasSubstr("FOR TESTS ONLY"));
  }
}

TEST(ProgramTest, ExecutesCommandsFromStandardInputUntilItEnds) {
  ProgramProcess program({"--end-with-stdin"});
  program.AwaitReady();
  program.SendInput("revoke _1\nstall\nresume\n");
  EXPECT_EQ(program.ReadLine(), "error no such token: _1");
  EXPECT_EQ(program.ReadLine(), "ok stalled");
  EXPECT_EQ(program.ReadLine(), "ok resumed");
  program.CloseInput();
  EXPECT_EQ(program.WaitForEnd(), 0);
}

TEST(ProgramTest, EndsOnSignalsWhileACommandWaits) {
  for (const int signal : {SIGTERM, SIGINT}) {
    ProgramProcess program({"--end-with-stdin"});
    program.AwaitReady();
    program.SendInput("requests\nwait requests 1 1h\n");
    EXPECT_EQ(program.ReadLine(), "ok requests=0");
    program.Signal(signal);
    EXPECT_EQ(program.WaitForEnd(), 0);
    EXPECT_THAT(program.Output(), HasSubstr("\nerror not reached: "));
  }
}

TEST(ProgramTest, ServesAndEndsAlthoughNobodyReadsItsOutput) {
  ProgramProcess program({"--end-with-stdin"});
  program.AwaitReady();
  const std::uint16_t port = PortIn(program.Value("http_url"));
  const std::string request = PostOf("not XML", std::string(6000, 'x'));
  constexpr int kRequests = 30;  // whose lines do not fit into the pipe
  for (int i = 0; i < kRequests; ++i) {
    RawClient client(port);
    client.Send(request);
    ASSERT_THAT(client.ReadAnswer(), StartsWith("HTTP/1.1 500 ")) << i;
  }
  program.SendInput("requests\n");
  for (int i = 0; i < kRequests; ++i) {
    EXPECT_THAT(program.ReadLine(), StartsWith("request "));
  }
  EXPECT_EQ(program.ReadLine(), "ok requests=30");
  for (int i = 0; i < kRequests; ++i) {
    RawClient client(port);
    client.Send(request);
    client.ReadAnswer();
  }
  program.Signal(SIGTERM);
  EXPECT_EQ(program.WaitForEndOnly(), 0);
}

TEST(ProgramTest, PausesAndRecoversWhenDescriptorsAreMissing) {
  ProgramProcess program({});
  program.AwaitReady();
  const std::uint16_t port = PortIn(program.Value("http_url"));
  rlimit limit{};
  ASSERT_EQ(prlimit(program.Id(), RLIMIT_NOFILE, nullptr, &limit), 0);
  const rlimit none{3, limit.rlim_max};
  ASSERT_EQ(prlimit(program.Id(), RLIMIT_NOFILE, &none, nullptr), 0);
  const RawClient first(port);  // has its descriptor from the call that already waits
  RawClient second(port);
  second.Send(PostOf(AliceEnvelope(), kIssueAction));
  clockid_t clock{};
  ASSERT_EQ(clock_getcpuclockid(program.Id(), &clock), 0);
  const auto cpuTime = [&] {
    timespec time{};
    EXPECT_EQ(clock_gettime(clock, &time), 0);
    return time.tv_sec * 1000 + time.tv_nsec / 1'000'000;
  };
  const long before = cpuTime();
  EXPECT_TRUE(second.IsSilent(std::chrono::milliseconds(200)));
  EXPECT_LT(cpuTime() - before, 60);
  ASSERT_EQ(prlimit(program.Id(), RLIMIT_NOFILE, &limit, nullptr), 0);
  EXPECT_THAT(second.ReadAnswer(), StartsWith("HTTP/1.1 200 "));
}

// The descriptor of a listening socket of another process at this port.
Descriptor ListenerOf(pid_t process, std::uint16_t port) {
  const Descriptor handle(static_cast<int>(syscall(SYS_pidfd_open, process, 0)));
  for (int number = 0; number < 64; ++number) {
    Descriptor copy(static_cast<int>(syscall(SYS_pidfd_getfd, handle.Get(), number, 0)));
    sockaddr_in address{};
    socklen_t size = sizeof address;
    if (getsockname(copy.Get(), reinterpret_cast<sockaddr*>(&address), &size) == 0 &&
        address.sin_family == AF_INET && ntohs(address.sin_port) == port) {
      return copy;
    }
  }
  return {};
}

TEST(ProgramTest, EndsWithAMessageWhenAPortAcceptsNoMore) {
  ProgramProcess program({});
  program.AwaitReady();
  const std::uint16_t port = PortIn(program.Value("https_url"));
  const Descriptor listener = ListenerOf(program.Id(), port);
  if (listener.Get() < 0) {
    GTEST_SKIP() << "This system does not let a process use descriptors of its child";
  }
  ASSERT_EQ(shutdown(listener.Get(), SHUT_RDWR), 0);
  EXPECT_EQ(program.WaitForEnd(), 1);
  EXPECT_THAT(program.Errors(), HasSubstr("ssoclient-devsts: port " + std::to_string(port) +
                                          " accepts no more connections: Invalid argument\n"));
}

TEST(ProgramTest, RunsInTheBackgroundUntilACommandEndsIt) {
  const ScratchFolder scratch;
  const std::string control = scratch / "control";
  const ProgramResult started =
      RunProgram({"--background", "--control", control, "--ready-file", scratch / "ready",
                  "--pid-file", scratch / "pid", "--log", scratch / "log"});
  ASSERT_EQ(started.status, 0) << started.errors;
  EXPECT_EQ(started.output, TextOfFile(scratch / "ready") + "ready\n");
  const pid_t process = static_cast<pid_t>(std::stol(TextOfFile(scratch / "pid")));
  const int end = static_cast<int>(syscall(SYS_pidfd_open, process, 0));
  ASSERT_GE(end, 0);
  const std::string ready = TextOfFile(scratch / "ready");
  const std::string url = ready.substr(9, ready.find('\n') - 9);
  EXPECT_THAT(AskAt(url), StartsWith("HTTP/1.1 200 "));
  EXPECT_EQ(Control(control, {"requests"}), "0 requests=1\n");
  EXPECT_EQ(Control(control, {"misbehave", "next", "1", "fault-text=two words"}),
            "0 misbehaving next 1\n");
  EXPECT_EQ(ElementText(AskAt(url), "faultstring"), "two words");
  EXPECT_EQ(Control(control, {"sing"}), "1 ssoclient-devsts: unknown command: sing\n");
  EXPECT_THAT(TextOfFile(scratch / "log"),
              AllOf(StartsWith("request connection="), HasSubstr(" fault=\"two words\"\n")));
  EXPECT_EQ(Control(control, {"quit"}), "0 quitting\n");
  AwaitEnd(end);
  EXPECT_FALSE(FileExists(scratch / "ready") || FileExists(scratch / "pid") || FileExists(control));
  EXPECT_THAT(Control(control, {"quit"}), AllOf(StartsWith("1 "), HasSubstr("no service listens")));
}

TEST(ProgramTest, TheFolderIsFreeAfterQuit) {
  const ScratchFolder scratch;
  const std::string control = scratch / "control";
  for (int i = 0; i < 5; ++i) {
    const ProgramResult started =
        RunProgram({"--background", "--control", control, "--state", scratch / "state"});
    ASSERT_EQ(started.status, 0) << started.errors;
    ASSERT_EQ(Control(control, {"quit"}), "0 quitting\n");
    EXPECT_FALSE(FileExists(control));
  }
}

TEST(ProgramTest, RunsInTheBackgroundWithoutStandardStreams) {
  const ScratchFolder scratch;
  const std::string control = scratch / "control";
  const std::string start = std::string(DEVSTS_PROGRAM) + " --background --control " + control;
  for (const char* closed : {" <&- >/dev/null 2>&-", " <&- >&- 2>&-"}) {
    ASSERT_EQ(std::system((start + closed).c_str()), 0) << closed;
    EXPECT_THAT(Control(control, {"counters"}), StartsWith("0 connections=0 ")) << closed;
    EXPECT_EQ(Control(control, {"quit"}), "0 quitting\n") << closed;
  }
}

TEST(ProgramTest, RemovesTheReadyFileOfAServiceThatWasKilled) {
  const ScratchFolder scratch;
  WriteTextTo(scratch / "ready", "http_url=http://127.0.0.1:1/sts\n");
  const ProgramResult result =
      RunProgram({"--ready-file", scratch / "ready", "--keytab", "/nonexistent"});
  EXPECT_EQ(result.status, 4);
  EXPECT_FALSE(FileExists(scratch / "ready"));
}

TEST(ProgramTest, ReplacesNoDevice) {
  const ScratchFolder scratch;
  const std::string device = scratch / "device";
  ASSERT_EQ(mkfifo(device.c_str(), 0600), 0);
  for (const char* option : {"--ready-file", "--pid-file"}) {
    const ProgramResult result = RunProgram({"--end-with-stdin", option, device});
    EXPECT_EQ(result.status, 4) << option;
    EXPECT_THAT(result.errors, HasSubstr(device + ": this is not a regular file")) << option;
    EXPECT_TRUE(FileExists(device)) << option;
  }
}

TEST(ProgramTest, ABackgroundStartThatFailsHasItsStatus) {
  const ScratchFolder scratch;
  const ProgramResult result = RunProgram({"--background", "--out", "/dev/null/out"});
  EXPECT_EQ(result.status, 4);
  EXPECT_THAT(result.errors, HasSubstr("/dev/null/out"));
}

TEST(ProgramTest, LeavesFilesThatAnotherServiceHasReplaced) {
  const ScratchFolder scratch;
  ProgramProcess program({"--pid-file", scratch / "pid"});
  program.AwaitReady();
  WriteTextTo(scratch / "pid", "another\n");
  program.Signal(SIGTERM);
  EXPECT_EQ(program.WaitForEnd(), 0);
  EXPECT_EQ(TextOfFile(scratch / "pid"), "another\n");
}

TEST(ProgramTest, PrintsNoRequestsWhenQuiet) {
  ProgramProcess program({"--quiet"});
  program.AwaitReady();
  AskAt(program.Value("http_url"));
  program.Signal(SIGTERM);
  EXPECT_EQ(program.WaitForEnd(), 0);
  EXPECT_THAT(program.Output(), Not(HasSubstr("request ")));
}

TEST(ProgramTest, KeepsItsKeysInAFolderThatOneProcessUses) {
  const ScratchFolder scratch;
  const std::string state = scratch / "state";
  std::string authority;
  for (int start = 0; start < 2; ++start) {
    ProgramProcess program({"--state", state, "--tls", "tls12-only"});
    program.AwaitReady();
    const std::string found = TextOfFile(state + "/ca.pem");
    EXPECT_TRUE(start == 0 || found == authority);
    authority = found;
    RawClient client(PortIn(program.Value("https_url")));
    EXPECT_EQ(client.StartTls(authority), X509_V_OK);
    client.Send(PostOf(AliceEnvelope(), kIssueAction));
    EXPECT_TRUE(VerifyXml(AssertionIn(client.ReadAnswer()), TextOfFile(state + "/signing.pem")));
    const ProgramResult second = RunProgram({"--state", state});
    EXPECT_EQ(second.status, 4);
    EXPECT_THAT(second.errors, HasSubstr("another process uses this folder"));
    program.Signal(SIGTERM);
    EXPECT_EQ(program.WaitForEnd(), 0);
  }
  WriteTextTo(state + "/signing.pem", "broken");
  const ProgramResult broken = RunProgram({"--state", state});
  EXPECT_EQ(broken.status, 4);
  EXPECT_THAT(broken.errors, HasSubstr("signing.pem"));
}

TEST(ProgramTest, PutsItsFilesIntoFoldersThatItMakes) {
  for (const char* option : {"--state", "--out"}) {
    const ScratchFolder scratch;
    const std::string folder = scratch / "sts";
    ProgramProcess program({option, folder, "--log", folder + "/log", "--control",
                            folder + "/control", "--pid-file", folder + "/pid", "--ready-file",
                            folder + "/ready"});
    program.AwaitReady();
    AskAt(program.Value("http_url"));
    EXPECT_THAT(TextOfFile(folder + "/log"), StartsWith("request ")) << option;
    EXPECT_EQ(Control(folder + "/control", {"requests"}), "0 requests=1\n");
    program.Signal(SIGTERM);
    EXPECT_EQ(program.WaitForEnd(), 0);
  }
}

TEST(ProgramTest, WritesNoLogThroughALink) {
  const ScratchFolder scratch;
  WriteTextTo(scratch / "file", "text");
  ASSERT_EQ(symlink((scratch / "file").c_str(), (scratch / "log").c_str()), 0);
  const ProgramResult result = RunProgram({"--log", scratch / "log", "--end-with-stdin"});
  EXPECT_EQ(result.status, 4);
  EXPECT_THAT(result.errors, HasSubstr((scratch / "log") + ": cannot be written: symbolic links"));
  const ProgramResult twin = RunProgram({"--log", scratch / "file", "--end-with-stdin"});
  EXPECT_EQ(twin.status, 0) << twin.errors;
}

TEST(ProgramTest, ReadsUsersAndPrincipalsFromAFile) {
  const ScratchFolder scratch;
  WriteTextTo(scratch / "accounts",
              "[user carol@EXAMPLE.COM]\npassword = pass word\n"
              "group = EXAMPLE\\pilots\nclient-certificate = yes\n");
  ProgramProcess program({"--accounts", scratch / "accounts", "--issuer", "urn:issuer"});
  program.AwaitReady();
  const std::string url = program.Value("http_url");
  const std::string answer = AskAt(url, IssueEnvelope("carol@EXAMPLE.COM", "pass word"));
  EXPECT_THAT(answer, AllOf(HasSubstr("EXAMPLE\\pilots"), HasSubstr(">urn:issuer<")));
  EXPECT_THAT(AskAt(url), HasSubstr("Invalid credentials")) << "alice is not in the file";
}

TEST(ProgramTest, MisbehavesFromTheStart) {
  ProgramProcess program({"--misbehave", "fault=wst:RequestFailed", "--misbehave=fault-text=later",
                          "--tls", "expired"});
  program.AwaitReady();
  EXPECT_EQ(ElementText(AskAt(program.Value("http_url")), "faultstring"), "later");
}

TEST(ProgramTest, SignsWithTheNamedKeyAndForm) {
  const ScratchFolder scratch;
  ProgramProcess program({"--assertion", "signing-key=ec-p256", "--assertion",
                          "signature=ecdsa-sha256", "--out", scratch / "out"});
  program.AwaitReady();
  const std::string answer = AskAt(program.Value("http_url"));
  EXPECT_THAT(answer, HasSubstr("ecdsa-sha256"));
  EXPECT_TRUE(VerifyXml(AssertionIn(answer), TextOfFile(scratch / "out/signing.pem")));
}

struct WrongStart {
  const char* name;
  std::vector<std::string> arguments;
  int status;
  const char* message;
};

class WrongStartTest : public testing::TestWithParam<WrongStart> {};

TEST_P(WrongStartTest, EndsWithAStatusOfItsKind) {
  const ProgramResult result = RunProgram(GetParam().arguments);
  EXPECT_EQ(result.status, GetParam().status);
  EXPECT_THAT(result.errors, HasSubstr(GetParam().message));
  EXPECT_EQ(result.output, "");
}

INSTANTIATE_TEST_SUITE_P(
    Each, WrongStartTest,
    testing::Values(
        WrongStart{"UnknownOption", {"--sing"}, 2, "--sing"},
        WrongStart{"NoValue", {"--state"}, 2, "--state"},
        WrongStart{"EmptyValue", {"--state", ""}, 2, "--state: The value is empty"},
        WrongStart{"Port", {"--http-port", "65536"}, 2, "--http-port"},
        WrongStart{"Exposed", {"--address", "0.0.0.0"}, 2, "--expose-to-network"},
        WrongStart{"Address", {"--address", "localhost"}, 2, "not a numeric address"},
        WrongStart{"Misbehaviour", {"--misbehave", "sing"}, 2, "--misbehave: there is no name"},
        WrongStart{"Tls", {"--tls", "sing"}, 2, "--tls: there is no name"},
        WrongStart{"Assertion", {"--assertion", "indent"}, 2, "--assertion: indent needs a value"},
        WrongStart{"Key", {"--assertion", "signing-key=ec-p256"}, 2, "needs an RSA key"},
        WrongStart{"Negotiation", {"--negotiation", "request-mic=1"}, 2, "has no value"},
        WrongStart{"Principal", {"--principal", "alice"}, 2, "NAME=USER"},
        WrongStart{"RealmAndKeytab", {"--realm", "--keytab", "any"}, 2, "excludes"},
        WrongStart{"KeytabsWithoutRealm", {"--user-keytabs", "any"}, 2, "need a realm"},
        WrongStart{"BackgroundWithInput", {"--background", "--end-with-stdin"}, 2, "excludes"},
        WrongStart{"ControlWithoutCommand", {"control", "path"}, 2, "usage: "},
        WrongStart{"Accounts", {"--accounts", "/nonexistent"}, 4, "/nonexistent: cannot be read"},
        WrongStart{"Log", {"--log", "/nonexistent/log"}, 4, "/nonexistent/log"},
        WrongStart{"State", {"--state", "/dev/null"}, 4, "/dev/null"},
        WrongStart{"Keytab", {"--keytab", "/nonexistent"}, 4, "the keytab cannot be read"},
        WrongStart{"Control", {"--control", "/nonexistent/control"}, 4, "/nonexistent/control"},
        WrongStart{"ForeignAddress",
                   {"--address", "203.0.113.1", "--expose-to-network"},
                   3,
                   "WARNING: listening on 203.0.113.1"},
        WrongStart{"MissingAddress",
                   {"--address", "203.0.113.1", "--expose-to-network"},
                   3,
                   "--address 203.0.113.1 cannot be opened: Cannot assign requested address"}),
    [](const auto& test) { return std::string(test.param.name); });

TEST(ProgramTest, ReportsAPortThatIsInUse) {
  ProgramProcess program({});
  program.AwaitReady();
  for (const std::string scheme : {"http", "https"}) {
    const std::string port = std::to_string(PortIn(program.Value(scheme + "_url")));
    const ProgramResult second = RunProgram({"--" + scheme + "-port", port});
    EXPECT_EQ(second.status, 3);
    EXPECT_THAT(second.errors, HasSubstr("ssoclient-devsts: --" + scheme + "-port " + port +
                                         " cannot be opened: Address already in use\n"));
  }
}

TEST(ProgramTest, ReportsAWrongLineOfTheAccounts) {
  const ScratchFolder scratch;
  WriteTextTo(scratch / "accounts", "[user a@B]\npasword = x\n");
  const ProgramResult result = RunProgram({"--accounts", scratch / "accounts"});
  EXPECT_EQ(result.status, 2);
  EXPECT_THAT(result.errors, HasSubstr((scratch / "accounts") + ":2: there is no key 'pasword'"));
}

TEST(ProgramTest, HelpBeginsWithAnExample) {
  const ProgramResult help = RunProgram({"--help"});
  EXPECT_EQ(help.status, 0);
  EXPECT_THAT(help.output, StartsWith("Example:\n  ssoclient-devsts --background "));
  EXPECT_THAT(help.output, HasSubstr("FOR TESTS ONLY"));
  EXPECT_THAT(help.output, HasSubstr("\nUsage: ssoclient-devsts [OPTIONS]\n"
                                     "  or:  ssoclient-devsts control PATH COMMAND...\n"));
  EXPECT_EQ(RunProgram({"--help-misbehaviour"}).output, Program::MisbehaviorHelp());
  EXPECT_EQ(RunProgram({"control", "--help"}).output, Program::ControlHelp());
  EXPECT_EQ(RunProgram({"--help-control"}).output, Program::ControlHelp());
  EXPECT_EQ(RunProgram({"--help-accounts"}).output, Program::AccountsHelp());
  EXPECT_THAT(RunProgram({"--version"}).output, StartsWith("ssoclient-devsts 1."));
}

}  // namespace
}  // namespace DevSts::Testing
