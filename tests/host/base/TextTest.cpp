// Ranges, amounts and MAC addresses as people write and read them.

#include <gtest/gtest.h>

#include "host/base/MacAddress.h"
#include "host/base/Printable.h"
#include "host/base/Text.h"
#include "tests/support/Cases.h"
#include "tests/support/FailureOf.h"

namespace host {
namespace {

using test::FailureOf;

TEST(Text, IsReadInItsFormsAndNamedWhenItIsWrong) {
    for (const auto& row : test::ReadTable("host/base/texts.txt", 3)) {
        const auto mac = ParseMacAddress(row[1]);
        const std::string outcome = row[0] == "range" ? FailureOf([&] { ParseRange(row[1]); })
                                    : mac             ? mac->Text()
                                                      : "refused";
        EXPECT_EQ(outcome.substr(0, row[2].size()), row[2]) << row[1];
    }
    EXPECT_EQ(ParseRange("0x400-7ff"), (base::AddressRange{0x400, 0x7FF}));
    EXPECT_EQ(ParseRange("0-ffffffff").Size(), 0x100000000U);
}

TEST(Text, NeverRoundsUpToAThousandOfAUnit) {
    EXPECT_EQ(SizeText(1047552) + SizeText(1048575) + SizeText(1048576), "1023 KiB1.0 MiB1 MiB");
    EXPECT_EQ(DurationText(0.9994) + DurationText(0.9996) + DurationText(59.94),
              "999 ms1.0 s59.9 s");
    EXPECT_EQ(DurationText(59.96) + DurationText(119.6), "1:002:00");
}

TEST(Printable, LeavesNothingThatATerminalObeys) {
    EXPECT_EQ(Printable("a\tb\n\x1b[2J\x7f \u00e4\u20ac\U0001F600 \xC2\x9b\x9b\xff"),
              "a\tb\\n\\x1b[2J\\x7f \u00e4\u20ac\U0001F600 \\u009b\\x9b\\xff");
    EXPECT_EQ(Printable("a\nb\r", Breaks::Keep), "a\nb\\x0d");
    EXPECT_EQ(Printable("cut \xE2\x82"), "cut \\xe2\\x82");
    EXPECT_EQ(PrintableJson("\"\u00e4\xC2\x9b\x7f\""), "\"\u00e4\\u009b\\u007f\"");
}

TEST(MacAddress, IsTwoRegistersAndObjectedToWhenItIsNobodys) {
    const MacAddress mac = *ParseMacAddress("02-1B-C3-04-05-06");
    EXPECT_EQ(mac.Register(0), 0x00C31B02U);
    EXPECT_EQ(mac.Register(1), 0x00060504U);
    EXPECT_EQ(mac.Objection(), "");
    for (const char* text : {"000000000000", "ffffffffffff", "03-1b-c3-04-05-06"})
        EXPECT_NE(ParseMacAddress(text)->Objection(), "") << text;
}

}  // namespace
}  // namespace host
