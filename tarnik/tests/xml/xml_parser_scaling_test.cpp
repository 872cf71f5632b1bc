#include <algorithm>
#include <cstddef>
#include <ctime>
#include <ostream>
#include <string>

#include <gtest/gtest.h>

#include <tarnik/core/object_impl.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "support/xml_text.h"
#include "xml/piece_reader.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;

// Processor time, which does not depend on other programs on the machine.
double SecondsToParse(const std::string& text, std::size_t piece) {
  double best = 1e9;
  for (int round = 0; round < 3; ++round) {
    const auto reader = MakeRef<PieceReader>(text, piece);
    const std::clock_t start = std::clock();
    try {
      ParseXml(reader.get());
    } catch (const XMLParseException&) {
      // A rejection must not take long either.
    }
    best = std::min(best, static_cast<double>(std::clock() - start) / CLOCKS_PER_SEC);
  }
  return best;
}

std::string LongAttribute(std::size_t size) {
  return "<a x='" + std::string(size, 'v') + "'/>";
}

std::string ManyAttributes(std::size_t count) {
  std::string text = "<a xmlns:p='urn:p'";
  for (std::size_t index = 0; index < count; ++index) {
    text += (index % 2 == 0 ? " p:x" : " x") + std::to_string(index) + "='v'";
  }
  return text + "/>";
}

std::string ManyDeclarations(std::size_t count) {
  std::string declarations;
  std::string uses;
  for (std::size_t index = 0; index < count; ++index) {
    const std::string number = std::to_string(index);
    declarations += " xmlns:p" + number + "='urn:" + number + "'";
    uses += " p" + number + ":x='v'";
  }
  return "<a" + declarations + uses + "/>";
}

std::string ManyElements(std::size_t count) {
  std::string text = "<a>";
  for (std::size_t index = 0; index < count; ++index) {
    text += "<e i='" + std::to_string(index) + "'>x</e>\n";
  }
  return text + "</a>";
}

struct ScalingCase {
  const char* name;
  std::string (*make)(std::size_t);
  std::size_t size;
  std::size_t piece;
};

void PrintTo(const ScalingCase& scaling, std::ostream* stream) {
  *stream << scaling.name;
}

class XMLParserScalingTest : public testing::TestWithParam<ScalingCase> {};

// Eight times the size may take 32 times as long, which leaves room for cache effects and sorting;
// quadratic cost would take 64 times as long.
TEST_P(XMLParserScalingTest, TakesTimeInProportionToTheSize) {
  const ScalingCase& scaling = GetParam();
  const double small = SecondsToParse(scaling.make(scaling.size / 8), scaling.piece);
  const double large = SecondsToParse(scaling.make(scaling.size), scaling.piece);
  EXPECT_LT(large, 32 * std::max(small, 1e-3));
}

INSTANTIATE_TEST_SUITE_P(
    Shapes, XMLParserScalingTest,
    testing::Values(ScalingCase{"LongAttributeInSingleBytes", LongAttribute, 1 << 20, 1},
                    ScalingCase{"LongAttribute", LongAttribute, 8 << 20, 1 << 20},
                    ScalingCase{"ManyAttributes", ManyAttributes, 100000, 1 << 20},
                    ScalingCase{"ManyDeclarations", ManyDeclarations, 40000, 1 << 20},
                    ScalingCase{"ManyElements", ManyElements, 40000, 1 << 20}),
    [](const auto& test) { return test.param.name; });

}  // namespace
}  // namespace Tarnik::Testing
