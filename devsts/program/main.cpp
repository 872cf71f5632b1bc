// ssoclient-devsts: a Security Token Service for tests.
#include <exception>
#include <functional>
#include <iostream>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "background.h"
#include "control_client.h"
#include "descriptor.h"
#include "errors.h"
#include "help_texts.h"
#include "options.h"
#include "service_run.h"

namespace {

using namespace DevSts::Program;

int Fail(const std::exception& error, ExitStatus status) {
  std::cerr << "ssoclient-devsts: " << error.what() << '\n';
  if (status == ExitStatus::Usage) {
    std::cerr << "See ssoclient-devsts --help.\n";
  }
  return static_cast<int>(status);
}

int Run(Options options, const std::function<void()>& ready) {
  try {
    RunService(std::move(options), ready);
    return static_cast<int>(ExitStatus::Ended);
  } catch (const ProgramError& error) {
    return Fail(error, error.Status());
  } catch (const std::exception& error) {
    return Fail(error, ExitStatus::Failed);
  }
}

int SendCommand(const std::vector<std::string>& arguments) {
  if (arguments.size() == 1 && arguments[0] == "--help") {
    std::cout << ControlHelp();
    return 0;
  }
  if (arguments.size() < 2) {
    throw UsageError("usage: ssoclient-devsts control PATH COMMAND...");
  }
  return RunControlClient(arguments[0], {arguments.begin() + 1, arguments.end()});
}

int Main(int argc, char** argv) {
  if (argc > 1 && std::string(argv[1]) == "control") {
    return SendCommand({argv + 2, argv + argc});
  }
  std::optional<Options> options = ParseOptions(argc, argv);
  if (!options) {
    return 0;
  }
  if (!options->inBackground) {
    return Run(std::move(*options), [] {});
  }
  return RunInBackground(
      [&](const std::function<void()>& ready) { return Run(std::move(*options), ready); });
}

}  // namespace

int main(int argc, char** argv) {
  OpenStandardStreams();
  try {
    return Main(argc, argv);
  } catch (const ProgramError& error) {
    return Fail(error, error.Status());
  } catch (const std::exception& error) {
    return Fail(error, ExitStatus::Failed);
  }
}
