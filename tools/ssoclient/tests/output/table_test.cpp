#include "output/table.h"

#include <sstream>

#include <gtest/gtest.h>

namespace SsoClient::Tool {
namespace {

struct Printed {
  std::ostringstream out;
  std::ostringstream err;
  Console console{.out = out, .err = err};
};

TEST(TableTest, ColumnsAreAsWideAsTheirWidestCell) {
  Printed printed;
  Table table("> ");
  table.Add({{"a"}, {"one"}});
  table.Add({{"東京"}, {"two"}});
  table.Add({{"é"}, {""}});
  table.Print(printed.console);
  EXPECT_EQ(printed.out.str(), "> a     one\n> 東京  two\n> é\n");
}

TEST(TableTest, TheLastColumnIsWrappedOnATerminal) {
  Printed printed;
  printed.console.outIsTerminal = true;
  printed.console.columns = 34;
  Table table("");
  table.Add({{"label"}, {"the quick brown fox jumps over the lazy dog"}});
  table.Print(printed.console);
  EXPECT_EQ(printed.out.str(),
            "label  the quick brown fox jumps\n"
            "       over the lazy dog\n");
}

TEST(TableTest, ElsewhereLinesAreAsLongAsTheirContent) {
  Printed printed;
  Table table("");
  const std::string text(200, 'a');
  table.Add({{"label"}, {text}});
  table.Print(printed.console);
  EXPECT_EQ(printed.out.str(), "label  " + text + "\n");
}

TEST(TableTest, CellsMayHaveSeveralLines) {
  Printed printed;
  Table table("");
  table.Add({{"a"}, {"one\ntwo"}});
  table.Add({{"b"}, {"three"}});
  table.Print(printed.console);
  EXPECT_EQ(printed.out.str(), "a  one\n   two\nb  three\n");
}

TEST(TableTest, ColoursDoNotCountAsColumns) {
  Printed printed;
  printed.console.outHasColours = true;
  Table table("");
  table.Add({{"a", Colour::kGood}, {"one", Colour::kBad}});
  table.Add({{"bb"}, {"two"}});
  table.Print(printed.console);
  EXPECT_EQ(printed.out.str(), "\x1b[32ma\x1b[0m   \x1b[31mone\x1b[0m\nbb  two\n");
}

}  // namespace
}  // namespace SsoClient::Tool
