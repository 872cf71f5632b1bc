#include <cstdint>
#include <limits>

#include <gtest/gtest.h>

#include <tarnik/system/date_time.h>
#include <tarnik/text/print.h>

namespace Tarnik::Testing {
namespace {

using Detail::ASPrintInternal;

TEST(ASPrintInternalTest, FillsPlaceholdersByNumber) {
  EXPECT_EQ(ASPrintInternal("%2 and %1, %2", {"a", "b"}), "b and a, b");
}

TEST(ASPrintInternalTest, ArgumentsAreNotScannedAgain) {
  EXPECT_EQ(ASPrintInternal("%1%2", {"%2", "x"}), "%2x");
}

TEST(ASPrintInternalTest, PercentWithoutAnArgumentStays) {
  EXPECT_EQ(ASPrintInternal("100% %0 %3 %", {"a", "b"}), "100% %0 %3 %");
}

TEST(ASPrintInternalTest, NumberEndsWhereArgumentsEnd) {
  EXPECT_EQ(ASPrintInternal("%12", {"a"}), "a2");
  EXPECT_EQ(ASPrintInternal("%10", {"1", "2", "3", "4", "5", "6", "7", "8", "9", "ten"}), "ten");
}

TEST(ASPrintInternalTest, AcceptsAnEmptyFormatAndNoArguments) {
  EXPECT_EQ(ASPrintInternal("", {}), "");
  EXPECT_EQ(ASPrintInternal("%1", {}), "%1");
}

TEST(PrintFormatterTest, PrintsEachTypeInItsForm) {
  EXPECT_EQ(PrintFormatter(true).Text(), "true");
  EXPECT_EQ(PrintFormatter(false).Text(), "false");
  EXPECT_EQ(PrintFormatter(-5).Text(), "-5");
  EXPECT_EQ(PrintFormatter(std::numeric_limits<std::int64_t>::min()).Text(),
            "-9223372036854775808");
  EXPECT_EQ(PrintFormatter(std::numeric_limits<std::uint64_t>::max()).Text(),
            "18446744073709551615");
  EXPECT_EQ(PrintFormatter(reinterpret_cast<const void*>(0xBEEF)).Text(), "0xbeef");
  EXPECT_EQ(PrintFormatter(System::DateTime::Parse("2024-03-05T07:08:09.01Z")).Text(),
            "2024-03-05T07:08:09.010Z");
}

TEST(DatePrintFormatterTest, PrintsTheReadableFormInUtc) {
  EXPECT_EQ(DatePrintFormatter(System::DateTime::Parse("2024-03-05T09:08:09.010999+02:00")).Text(),
            "2024-03-05 07:08:09.010 UTC");
}

}  // namespace
}  // namespace Tarnik::Testing
