#include "tamber/MessageFormatter.h"

#include <gtest/gtest.h>

namespace {

using Tamber::MessageFormatter::ASPrint;
using Tamber::MessageFormatter::ASPrintArray;
using Tamber::MessageFormatter::BoolPrintFormatter;
using Tamber::MessageFormatter::DatePrintFormatter;

TEST(MessageFormatterTest, SubstitutesEveryPlaceholderInAnyOrder) {
  EXPECT_EQ(ASPrint("%2 then %1", "a", "b"), "b then a");
  EXPECT_EQ(ASPrint("%1%2%3%4%5%6%7%8%9", 1, 2, 3, 4, 5, 6, 7, 8, 9), "123456789");
  EXPECT_EQ(ASPrint("no placeholders"), "no placeholders");
  EXPECT_EQ(ASPrint(""), "");
}

TEST(MessageFormatterTest, RepeatsAPlaceholderAsOftenAsItAppears) {
  EXPECT_EQ(ASPrint("%1-%1-%1", "x"), "x-x-x");
}

TEST(MessageFormatterTest, CopiesPlaceholdersWithoutArgumentUnchanged) {
  EXPECT_EQ(ASPrint("%1 %2 %3", "a"), "a %2 %3");
  EXPECT_EQ(ASPrint("%1"), "%1");
  EXPECT_EQ(ASPrint("%0 %a 100% %"), "%0 %a 100% %");
}

TEST(MessageFormatterTest, CopiesDoublePercentAsItStands) {
  EXPECT_EQ(ASPrint("%%1 %1", "a"), "%%1 a");
  EXPECT_EQ(ASPrint("50%%", "a"), "50%%");
}

TEST(MessageFormatterTest, DoesNotRescanArgumentText) {
  EXPECT_EQ(ASPrint("%1 %2", "%2", "b"), "%2 b");
  EXPECT_EQ(ASPrint("[%1]", "%1%1"), "[%1%1]");
}

TEST(MessageFormatterTest, FormatsEveryArgumentKind) {
  const std::string text = "text";
  EXPECT_EQ(ASPrint("%1 %2 %3 %4 %5 %6", text, -1, 2u, -3L, 4UL, static_cast<const char*>(nullptr)),
            "text -1 2 -3 4 ");
  EXPECT_EQ(ASPrint("%1 %2", -9223372036854775807LL - 1, 18446744073709551615ULL),
            "-9223372036854775808 18446744073709551615");
  EXPECT_EQ(ASPrint("%1/%2", BoolPrintFormatter(true), BoolPrintFormatter(false)), "true/false");
  EXPECT_EQ(ASPrint("at %1", DatePrintFormatter(Tamber::System::DateTime("2009-03-05T07:08:09.004Z"))),
            "at 2009-03-05T07:08:09.004Z");
}

TEST(MessageFormatterTest, NullFormatGivesEmptyText) {
  EXPECT_EQ(ASPrintArray(nullptr, nullptr, 0), "");
}

}  // namespace
