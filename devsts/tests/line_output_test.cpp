#include "line_output.h"

#include <array>
#include <chrono>
#include <csignal>
#include <optional>
#include <string>
#include <thread>

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include "program_process.h"

namespace DevSts::Testing {
namespace {

using Program::Descriptor;
using Program::LineOutput;
using testing::EndsWith;

const std::string kLongLine(1023, 'x');
constexpr std::size_t kLinesThatAreKept = 1024;  // and as many again may be in the pipe

class LineOutputTest : public testing::Test {
 protected:
  LineOutputTest() {
    std::array<int, 2> ends{};
    EXPECT_EQ(pipe2(ends.data(), O_CLOEXEC), 0);
    reader = Descriptor(ends[0]);
    writer = Descriptor(ends[1]);
    output.emplace(writer.Get());
    output->Start();
  }

  std::size_t SizeInPipe() const {
    int size = 0;
    EXPECT_EQ(ioctl(reader.Get(), FIONREAD, &size), 0);
    return static_cast<std::size_t>(size);
  }
  // Reads until the text ends with the last line.
  std::string ReadTo(const std::string& last) const {
    std::string text;
    std::array<char, 4096> octets{};
    while (text.size() < last.size() || text.substr(text.size() - last.size()) != last) {
      const ssize_t size = read(reader.Get(), octets.data(), octets.size());
      if (size <= 0) {
        break;
      }
      text.append(octets.data(), static_cast<std::size_t>(size));
    }
    return text;
  }
  void WriteMoreThanIsKept() {
    for (std::size_t i = 0; i < 2 * kLinesThatAreKept; ++i) {
      output->Write(kLongLine);
    }
  }

  Descriptor reader;
  Descriptor writer;
  std::optional<LineOutput> output;
};

TEST_F(LineOutputTest, WritesALineBeforeItReturns) {
  output->Write("one");
  EXPECT_EQ(SizeInPipe(), 4U);
  output->WriteEach("two");
  EXPECT_EQ(ReadTo("two\n"), "one\ntwo\n");
}

TEST_F(LineOutputTest, KeepsLinesUntilItStarts) {
  LineOutput later(writer.Get());
  later.Write("one");
  EXPECT_EQ(SizeInPipe(), 0U);
  later.Start();
  EXPECT_EQ(ReadTo("one\n"), "one\n");
}

TEST_F(LineOutputTest, WritesWhatIsKeptWhenTheReaderReads) {
  std::string expected;
  for (int i = 0; i < 500; ++i) {
    const std::string line = std::to_string(i) + kLongLine;
    output->Write(line);
    expected += line + "\n";
  }
  EXPECT_LT(SizeInPipe(), expected.size());
  output->Write("last");
  expected += "last\n";
  const std::string text = ReadTo("\nlast\n");
  EXPECT_TRUE(text == expected) << "all lines, in order, of " << text.size() << " octets";
}

TEST_F(LineOutputTest, CountsTheLinesThatItLoses) {
  WriteMoreThanIsKept();
  // Reading makes room, after which the next line is kept.
  const std::string begin = ReadTo(kLongLine + "\n");
  std::string text;
  while (text.find("requests-lost=") == std::string::npos) {
    output->Write("next");
    std::array<char, 4096> octets{};
    const ssize_t size = read(reader.Get(), octets.data(), octets.size());
    ASSERT_GT(size, 0);
    text.append(octets.data(), static_cast<std::size_t>(size));
  }
  output->Write("last");
  text += ReadTo("last\n");
  EXPECT_THAT(text, testing::ContainsRegex("\nrequests-lost=[0-9]+\nnext\n"));
}

TEST_F(LineOutputTest, AThreadWaitsForItsReaderOnlyUntilWaitsEnd) {
  WriteMoreThanIsKept();
  std::thread writing([this] { output->WriteEach("each"); });
  std::thread reading([this] { ReadTo("\neach\n"); });
  writing.join();
  reading.join();
  WriteMoreThanIsKept();
  std::thread waiting([this] { output->WriteEach("kept"); });
  output->EndWaits();
  waiting.join();
}

TEST_F(LineOutputTest, EndsAlthoughNobodyReads) {
  WriteMoreThanIsKept();
  const auto begin = std::chrono::steady_clock::now();
  output.reset();
  EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(20));
}

TEST_F(LineOutputTest, WritesTheRestAtItsEnd) {
  const int size = fcntl(writer.Get(), F_SETPIPE_SZ, 4096);
  ASSERT_GT(size, 0);
  std::string text;
  for (int i = 0; i < 20; ++i) {
    output->Write(kLongLine);
  }
  std::thread reading([&] { text = ReadTo("\nlast\n"); });
  output->Write("last");
  output.reset();
  writer = Descriptor();
  reading.join();
  EXPECT_THAT(text, EndsWith("\nlast\n"));
}

TEST_F(LineOutputTest, DoesNotChangeTheFlagsOfItsDescriptor) {
  EXPECT_EQ(fcntl(writer.Get(), F_GETFL) & O_NONBLOCK, 0);
}

TEST_F(LineOutputTest, AReaderThatHasGoneIsNoError) {
  const auto before = std::signal(SIGPIPE, SIG_IGN);
  reader = Descriptor();
  output->Write("one");
  output->WriteEach("two");
  output.reset();
  std::signal(SIGPIPE, before);
}

TEST_F(LineOutputTest, AppendsToAFile) {
  const ScratchFolder scratch;
  WriteTextTo(scratch / "log", "before\n");
  const Descriptor file(open((scratch / "log").c_str(), O_WRONLY | O_APPEND | O_CLOEXEC));
  LineOutput log(file.Get());
  log.Start();
  log.Write("after");
  EXPECT_EQ(TextOfFile(scratch / "log"), "before\nafter\n");
}

}  // namespace
}  // namespace DevSts::Testing
