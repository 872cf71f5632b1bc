#include "output/console.h"
#include "process.h"
#include "program.h"

int main(int argc, char** argv) {
  using namespace SsoClient::Tool;
  PrepareProcess();
  const Console console = Console::OfProcess();
  EndProcess(FinishOutput(console, RunProgram(argc, argv, console)));
}
