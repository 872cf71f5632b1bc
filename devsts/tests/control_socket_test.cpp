#include "control_socket.h"

#include <atomic>
#include <cerrno>
#include <chrono>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>

#include "devsts/server.h"
#include "errors.h"
#include "program_process.h"
#include "replaced_calls.h"

namespace DevSts::Testing {
namespace {

using Program::Commands;
using Program::ControlSocket;
using Program::Descriptor;
using Program::FileError;
using testing::StartsWith;

// A client of the socket.
class Client {
 public:
  explicit Client(const std::string& path)
      : socket_(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    const sockaddr_un address = Program::AddressOf(path);
    connected_ =
        connect(socket_.Get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0;
  }

  bool IsConnected() const { return connected_; }
  bool Send(const std::string& text) const {
    return send(socket_.Get(), text.data(), text.size(), MSG_NOSIGNAL) ==
           static_cast<ssize_t>(text.size());
  }
  void EndSending() const { shutdown(socket_.Get(), SHUT_WR); }
  // The next line without its end, or what arrived before the service ended the connection.
  std::string ReadLine() {
    char octet = 0;
    std::string line;
    while (recv(socket_.Get(), &octet, 1, 0) == 1 && octet != '\n') {
      line += octet;
    }
    return line;
  }
  std::string Ask(const std::string& line) { return Send(line + "\n") ? ReadLine() : "not sent"; }

 private:
  Descriptor socket_;
  bool connected_ = false;
};

class ControlSocketTest : public testing::Test {
 protected:
  void Start() {
    control = std::make_unique<ControlSocket>(path);
    control->Start(
        commands, [this] { ++quits; },
        [this](const std::string&) {
          ++failures;
          failures.notify_all();
        });
  }

  ScratchFolder scratch;
  const std::string path = scratch / "control";
  Server server;
  Commands commands{server, DemoUsers(), AssertionOptions(), Program::Revocations({}, "")};
  std::atomic<int> quits = 0;
  std::atomic<int> failures = 0;
  std::unique_ptr<ControlSocket> control;
};

TEST_F(ControlSocketTest, OnlyTheOwnerConnectsAndItIsRemovedAtTheEnd) {
  Start();
  EXPECT_EQ(ModeOf(path), 0600U);
  control.reset();
  EXPECT_FALSE(FileExists(path));
}

TEST_F(ControlSocketTest, AnswersEachLineWithALine) {
  Start();
  Client client(path);
  EXPECT_EQ(client.Ask("requests"), "ok requests=0");
  EXPECT_THAT(client.Ask("sing\r\n"), StartsWith("error unknown command: sing"));
  EXPECT_THAT(client.ReadLine(), StartsWith("error there is no command"));
  ASSERT_TRUE(client.Send("requests\nclear\nreq"));
  EXPECT_EQ(client.ReadLine(), "ok requests=0");
  EXPECT_EQ(client.ReadLine(), "ok cleared");
  EXPECT_EQ(client.Ask("uests"), "ok requests=0");
}

TEST_F(ControlSocketTest, ConcurrentClientsDoNotWaitForEachOther) {
  Start();
  const Client silent(path);
  Client waiting(path);
  ASSERT_TRUE(waiting.Send("wait requests 1 1h\n"));
  std::vector<std::thread> threads;
  std::atomic<int> right = 0;
  for (int i = 0; i < 8; ++i) {
    threads.emplace_back([&] {
      Client client(path);
      for (int j = 0; j < 20; ++j) {
        right += client.Ask("requests") == "ok requests=0" ? 1 : 0;
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(right, 160);
  control.reset();  // with clients that are silent or wait
  EXPECT_THAT(waiting.ReadLine(), testing::AnyOf("", StartsWith("error not reached")));
}

TEST_F(ControlSocketTest, EndsAClientWhoseLineIsTooLong) {
  Start();
  Client client(path);
  client.Send(std::string(200'000, 'x'));
  EXPECT_EQ(client.ReadLine(), "error the line is too long");
  EXPECT_EQ(client.ReadLine(), "");
  EXPECT_EQ(Client(path).Ask("requests"), "ok requests=0");
}

TEST_F(ControlSocketTest, RefusesTooManyClientsUntilSomeEnd) {
  Start();
  std::vector<std::unique_ptr<Client>> clients;
  for (int i = 0; i < 64; ++i) {
    clients.push_back(std::make_unique<Client>(path));
    ASSERT_EQ(clients.back()->Ask("requests"), "ok requests=0");
  }
  EXPECT_EQ(Client(path).ReadLine(), "error there are too many clients");
  clients.back()->EndSending();
  EXPECT_EQ(clients.back()->ReadLine(), "");  // the service has ended it
  EXPECT_EQ(Client(path).Ask("requests"), "ok requests=0");
}

TEST_F(ControlSocketTest, AShortageDoesNotEndIt) {
  const AcceptErrors errors(AF_UNIX, {EMFILE, ENFILE, ENOMEM, ECONNABORTED, EPROTO});
  Start();
  EXPECT_EQ(Client(path).Ask("requests"), "ok requests=0");
  EXPECT_EQ(failures, 0);
  const auto times = AcceptErrors::AwaitTimes();
  EXPECT_GE(times.at(1) - times.at(0), std::chrono::milliseconds(20)) << "it pauses";
}

TEST_F(ControlSocketTest, ReportsThatItCanAcceptNoMore) {
  const AcceptErrors errors(AF_UNIX, {EINVAL});
  Start();
  failures.wait(0);
  control.reset();
  EXPECT_EQ(failures, 1);
}

TEST_F(ControlSocketTest, QuitsAfterTheAnswer) {
  Start();
  Client client(path);
  EXPECT_EQ(client.Ask("quit\nrequests"), "ok quitting");
  EXPECT_EQ(client.ReadLine(), "");
  EXPECT_EQ(quits, 1);
}

TEST_F(ControlSocketTest, ReplacesASocketThatNobodyListensAt) {
  {
    const Descriptor stale(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
    const sockaddr_un address = Program::AddressOf(path);
    ASSERT_EQ(bind(stale.Get(), reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
  }
  ASSERT_TRUE(FileExists(path));
  Start();
  EXPECT_EQ(Client(path).Ask("requests"), "ok requests=0");
}

TEST_F(ControlSocketTest, TakesNoPathFromOthers) {
  Start();
  EXPECT_THROW(ControlSocket second(path), FileError);
  EXPECT_EQ(Client(path).Ask("requests"), "ok requests=0");
  WriteTextTo(scratch / "file", "text");
  EXPECT_THROW(ControlSocket(scratch / "file"), FileError);
  EXPECT_EQ(TextOfFile(scratch / "file"), "text");
  EXPECT_THROW(ControlSocket(scratch / std::string(200, 'x')), FileError);
  EXPECT_THROW(ControlSocket("/nonexistent/control"), FileError);
}

}  // namespace
}  // namespace DevSts::Testing
