#include "output/console.h"
#include "program.h"

int main(int argc, char** argv) {
  using SsoClient::Tool::Console;
  return static_cast<int>(SsoClient::Tool::RunProgram(argc, argv, Console::OfProcess()));
}
