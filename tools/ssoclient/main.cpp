#include <exception>
#include <ostream>

#include "output/console.h"
#include "process.h"
#include "program.h"

int main(int argc, char** argv) {
  using namespace SsoClient::Tool;
  PrepareProcess();
  const Console console = Console::OfProcess();
  try {
    EndProcess(FinishOutput(console, RunProgram(argc, argv, console)));
  } catch (const std::exception& exception) {
    // Such as a lack of memory while a failure is reported
    console.err << "ssoclient: " << exception.what() << '\n' << std::flush;
    EndProcess(ExitStatus::kLocal);
  }
}
