#include "input/secret.h"

#include <cerrno>

#include <CLI/CLI.hpp>
#include <unistd.h>

#include "failure.h"
#include "input/decimal_text.h"
#include "input/descriptor.h"
#include "input/private_file.h"
#include "input/terminal.h"

namespace SsoClient::Tool {
namespace {

constexpr std::size_t kMaxSecretBytes = 1024;
// A file may contain more than the secret, such as a comment.
constexpr std::size_t kMaxSecretFileBytes = std::size_t{64} * 1024;

// The library's own texts contain the value, which may be the secret itself by mistake.
std::string CheckDescriptor(const std::string& text) {
  constexpr std::size_t kMostDigits = 9;
  return IsDecimal(text, kMostDigits) ? std::string() : "it must be the number of a descriptor";
}

// One byte at a time, since the rest belongs to others.
SecretText ReadLine(int descriptor, const std::string& name) {
  SecretText line;
  char next = '\0';
  while (line.Text().size() <= kMaxSecretBytes) {
    const ssize_t size = RetryInterrupted([&] { return read(descriptor, &next, 1); });
    if (size < 0) {
      throw ToolException(
          {ExitStatus::kLocal, KindName::Find(name + "-fd"),
           "cannot read the descriptor " + std::to_string(descriptor) + ": " + SystemMessage(errno),
           ""});
    }
    if (size == 0 || next == '\n') {
      break;
    }
    line.Append(&next, 1);
  }
  return line;
}

}  // namespace

void SecretOption::AddTo(CLI::App& command, const std::string& name, const std::string& group) {
  name_ = name;
  CLI::Option* const file = command.add_option(
      "--" + name + "-file", file_, "Read the " + name + " from the first line of this file");
  file->type_name("FILE")->group(group);
  command
      .add_option("--" + name + "-fd", descriptor_,
                  "Read the " + name + " from the first line of this file descriptor")
      ->check(CheckDescriptor)
      ->type_name("NUMBER")
      ->excludes(file)
      ->group(group);
}

SecretText SecretOption::ReadUnchecked(const std::string& prompt, bool mayBeOpen) const {
  if (!file_.empty()) {
    return ReadPrivateFile(
        {.path = file_, .what = name_, .maxBytes = kMaxSecretFileBytes, .mayBeOpen = mayBeOpen});
  }
  if (descriptor_ >= 0) {
    return isatty(descriptor_) == 1 ? ReadFromTerminal(descriptor_, prompt, kMaxSecretBytes)
                                    : ReadLine(descriptor_, name_);
  }
  if (!HasTerminal()) {
    throw ToolException({ExitStatus::kUsage, KindName::Find("no-" + name_),
                         "there is no terminal to ask for the " + name_,
                         "use --" + name_ + "-file or --" + name_ + "-fd"});
  }
  return ReadFromTerminal(prompt, kMaxSecretBytes);
}

SecretText SecretOption::Read(const std::string& prompt, bool mayBeOpen) const {
  SecretText secret = ReadUnchecked(prompt, mayBeOpen);
  const std::size_t lineFeed = secret.Text().find('\n');
  if (lineFeed != std::string::npos) {
    secret.Truncate(lineFeed);
  }
  if (!secret.Text().empty() && secret.Text().back() == '\r') {
    secret.Truncate(secret.Text().size() - 1);
  }
  if (secret.Text().empty()) {
    throw ToolException(
        {ExitStatus::kLocal, KindName::Find("no-" + name_), "the " + name_ + " is empty", ""});
  }
  if (secret.Text().size() > kMaxSecretBytes) {
    throw ToolException(
        {ExitStatus::kLocal, KindName::Find(name_ + "-long"),
         "the " + name_ + " is longer than " + std::to_string(kMaxSecretBytes) + " bytes", ""});
  }
  return secret;
}

}  // namespace SsoClient::Tool
