// Hexadecimal texts, checksums and sets of addresses.

#include <gtest/gtest.h>

#include <string>

#include "base/AddressSet.h"
#include "base/Crc32.h"
#include "base/Hex.h"
#include "tests/support/Cases.h"

namespace base {
namespace {

TEST(Hex, NumbersAreReadWhole) {
    for (const auto& row : test::ReadTable("base/hex.txt", 2)) {
        const auto number = ParseHex32(test::Unescaped(row[0]));
        EXPECT_EQ(number ? std::to_string(*number) : "", row[1]) << row[0];
    }
}

TEST(Crc32, IsTheOneOfDebuggers) {
    EXPECT_EQ(AddToCrc32(AddToCrc32(kCrc32Begin, "1234"), "56789"), 0x0376E6E7U);
}

TEST(AddressSet, JoinsWhatOverlapsOrTouches) {
    AddressSet set;
    for (const AddressRange& range : {AddressRange{0x40, 0x4F},
                                      {0x80, 0x8F},
                                      {0x70, 0x7F},
                                      {0x10, 0x1F},
                                      {0x20, 0x2F},
                                      {0x48, 0x58},
                                      {0xFFFFFFF0, 0xFFFFFFFF}})
        set.Add(range);
    EXPECT_EQ(set.Ranges(),
              (std::vector<AddressRange>{
                  {0x10, 0x2F}, {0x40, 0x58}, {0x70, 0x8F}, {0xFFFFFFF0, 0xFFFFFFFF}}));
    EXPECT_EQ(set.BytesIn({0x2F, 0x80}), 0x2BU);
    set.Add({0x18, 0xFFFFFFFF});
    EXPECT_EQ(set.Bytes(), 0xFFFFFFF0U);
}

}  // namespace
}  // namespace base
