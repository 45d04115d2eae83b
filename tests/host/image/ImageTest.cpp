// Image files: what the readers make of good and of bad files, measured against other tools where
// they know the format, and that what is written can be read again.

#include "host/image/Image.h"

#include <fmt/format.h>
#include <fmt/ranges.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <map>
#include <random>

#include "base/Hex.h"
#include "host/base/Errors.h"
#include "tests/support/Cases.h"
#include "tests/support/FailureOf.h"
#include "tests/support/TemporaryDirectory.h"

namespace host::image {

void PrintTo(const Image& image, std::ostream* out) {
    *out << FormatImage(image, Format::SRecord);
}

namespace {

using Bytes = std::vector<std::uint8_t>;

Image MakeImage(const std::vector<Section>& sections) {
    Image image;
    for (const Section& section : sections)
        image.Add(section.address, section.bytes, "test");
    return image;
}

/// The status of a failure and what is wrong: its text without the advice behind the semicolon.
template <typename Work>
std::string FailureOf(Work work) {
    const std::string text = test::FailureOf(work);
    return text.substr(0, text.find(';'));
}

/// Its bytes at their addresses, or what is wrong with it.
std::string ReadingOf(const std::string& contents, const ReadOptions& options = {}) {
    std::string text;
    const std::string failure = FailureOf([&] {
        const Image image = ParseImage(contents, "f", options);
        for (const Section& section : image.Sections())
            text += fmt::format(" {:x}:{:02x}", section.address, fmt::join(section.bytes, ""));
    });
    return failure.empty() ? text.substr(1) : failure;
}

TEST(Image, JoinsAndOrdersLikeAMapOfBytes) {
    std::mt19937 random(1);
    for (int round = 0; round < 200; ++round) {
        std::map<std::uint32_t, std::uint8_t> model;
        Image image;
        for (int i = 0; i < 30; ++i) {
            const auto address = static_cast<std::uint32_t>(random() % 300);
            Bytes bytes(random() % 20);
            for (std::uint32_t k = 0; k < bytes.size(); ++k) {
                model[address + k] = bytes[k] = static_cast<std::uint8_t>((address + k) * 7);
            }
            image.Add(address, bytes, "test");
        }
        std::vector<Section> expected;
        for (const auto& [address, byte] : model) {
            if (expected.empty() || expected.back().End() != address) {
                expected.push_back({address, {}});
            }
            expected.back().bytes.push_back(byte);
        }
        ASSERT_EQ(expected, image.Sections());
        ASSERT_EQ(model.size(), image.ByteCount());
    }
}

TEST(Image, IsUnchangedByWhatItRefuses) {
    Image image = MakeImage({{0x10, {1, 2, 3}}, {0xFFFFFFFE, {4, 5}}});
    const Image before = image;
    const Bytes different{0, 1, 2, 9}, tooLong{4, 5, 6};
    EXPECT_EQ("3: b.elf puts 0x09 at address 0x12, where 0x03 stands already",
              FailureOf([&] { image.Add(0x0F, different, "b.elf"); }));
    EXPECT_EQ("3: b.elf: 3 bytes at address 0xfffffffe run past 0xffffffff",
              FailureOf([&] { image.Add(0xFFFFFFFE, tooLong, "b.elf"); }));
    FailureOf([&] { image.Add(MakeImage({{0, {1}}, {0x11, {3}}}), "b.elf"); });
    EXPECT_EQ(before, image);
    image.Add(MakeImage({{0, {1}}, {0x11, {2}}, {0x13, {3}}}), "b.elf");
    EXPECT_EQ(MakeImage({{0, {1}}, {0x10, {1, 2, 3, 3}}, {0xFFFFFFFE, {4, 5}}}), image);
}

TEST(ImageFile, IsReadOrRefusedByWhatItHolds) {
    for (const auto& row : test::ReadTable("host/image/files.txt", 4)) {
        const ReadOptions options{FormatFromName(row[2]), base::ParseHex32(row[3])};
        EXPECT_EQ(ReadingOf(test::Unescaped(row[0]), options), row[1]);
    }
}

// --- ELF

struct Segment {
    std::uint32_t type;
    std::uint64_t offset, address, fileSize;
};

/// A 32-bit little-endian executable with these segments, and `bytes` behind its tables.
std::string MakeElf(const std::vector<Segment>& segments, const std::string& bytes) {
    std::string elf{0x7F, 'E', 'L', 'F', 1, 1, 1};
    elf.resize(16);
    const std::uint64_t headerSize = 52;
    const std::uint64_t entrySize = 32;
    const auto put = [&](std::uint64_t value, int size) {
        for (int i = 0; i < size; ++i)
            elf += static_cast<char>(value >> 8 * i);
    };
    put(2, 2), put(40, 2), put(1, 4), put(0, 4);
    put(headerSize, 4), put(0, 4), put(0, 4), put(headerSize, 2), put(entrySize, 2);
    put(segments.size(), 2), put(0, 6);
    for (const auto& [kind, offset, address, fileSize] : segments) {
        put(kind, 4), put(headerSize + segments.size() * entrySize + offset, 4);
        put(0x20000000, 4), put(address, 4), put(fileSize, 4), put(fileSize + 8, 4);
        put(5, 4), put(4, 4);
    }
    return elf + bytes;
}

// Each row: what is done to the bytes of a good file (one is another, or it is cut there), and what
// is said then.
TEST(ImageFile, LoadsElfSegmentsAndRefusesFilesThatAreCutOffOrUnfit) {
    const std::vector<Segment> segments{
        {1, 0, 0x8000, 3}, {1, 0, 0x20000000, 0}, {6, 0, 0x30, 1}, {1, 3, 0xFFFFFFFF, 1}};
    EXPECT_EQ(ReadingOf(MakeElf(segments, "abcd")), "8000:616263 ffffffff:64");
    EXPECT_EQ(ReadingOf(MakeElf({{1, 0, 0, 0}}, "")), "3: f: no bytes to load found (read as elf)");
    EXPECT_EQ(ReadingOf(MakeElf({{1, 0, 8, 2}, {1, 1, 9, 1}, {1, 0, 9, 1}}, "ab")),
              "3: f: segment 2 puts 0x61 at address 0x9, where 0x62 stands already");
    for (const auto& row : test::ReadTable("host/image/elf.txt", 2)) {
        std::string elf = MakeElf({{1, 0, 0x8000, 4}}, "abcd");
        for (const std::string& edit : test::Split(row[0], " ")) {
            const std::size_t place = std::stoul(edit), equals = edit.find('=');
            if (equals == edit.npos)
                elf.resize(place);
            else
                elf[place] = static_cast<char>(std::stoi(edit.substr(equals + 1)));
        }
        EXPECT_EQ(ReadingOf(elf), "3: f: " + row[1]) << row[0];
    }
}

// --- Damage

/// Whether damaged contents are refused, or at least read as what they were; anything but a
/// Failure thrown ends the test.
bool RefusedOrSame(const Image& image, const std::string& contents, Format format) {
    try {
        return image == ParseImage(contents, "f", {format, {}});
    } catch (const Failure&) {
        return true;
    }
}

TEST(ImageFile, NeverTakesADamagedFileForAnother) {
    const Image image = MakeImage({{0xFFF8, Bytes(20, 'Z')}, {0x20000, {1, 2, 3}}});
    const std::pair<Format, std::string> files[] = {
        {Format::Elf,
         MakeElf({{1, 0, 0xFFF8, 20}, {1, 20, 0x20000, 3}}, std::string(20, 'Z') + "\1\2\3")},
        {Format::IntelHex, FormatImage(image, Format::IntelHex)},
        {Format::SRecord, FormatImage(image, Format::SRecord)}};
    for (const auto& [format, whole] : files) {
        ASSERT_EQ(image, ParseImage(whole, "f", {}));
        for (std::size_t place = 0; place < whole.size(); ++place) {
            EXPECT_TRUE(RefusedOrSame(image, whole.substr(0, place), format)) << place;
            // Nothing guards the bytes of an ELF file and the type of an S-record.
            const bool guarded =
                format == Format::IntelHex ||
                (format == Format::SRecord && (place == 0 || whole[place - 1] != 'S'));
            for (int change = 1; change < 256; ++change) {
                std::string damaged = whole;
                damaged[place] = static_cast<char>(damaged[place] ^ change);
                EXPECT_TRUE(RefusedOrSame(image, damaged, format) || !guarded)
                    << FormatName(format) << " byte " << place << " changed by " << change;
            }
        }
    }
}

// --- Writing

TEST(ImageFile, WritesRecordsThatEndAtMultiplesOfTheirLength) {
    const Image image = MakeImage({{0xFFFD, {1, 2, 3, 4}}, {0x10020, {5}}});
    EXPECT_EQ(":03FFFD00010203FB\n:020000040001F9\n:0100000004FB\n:0100200005DA\n:00000001FF\n",
              FormatImage(image, Format::IntelHex));
    EXPECT_EQ(
        "S00600004844521B\nS3080000FFFD010203F5\nS3060001000004F4\nS3060001002005D3\n"
        "S5030003F9\nS70500000000FA\n",
        FormatImage(image, Format::SRecord));
    for (const char* path : {"a.s19", "a.S28", "a.s37", "a.srec", "a.mot", "a.mhx"})
        EXPECT_EQ(FormatForWriting(path), Format::SRecord) << path;
    EXPECT_EQ(std::string("\1\2\3\4") + std::string(31, '\xFF') + "\5",
              FormatImage(image, Format::Binary));
}

TEST(ImageFile, RefusesToWriteElfAndHugeGaps) {
    const Image far = MakeImage({{0, {1}}, {0x10000000, {2}}});
    EXPECT_EQ(
        "2: raw binary: the gaps filled, the bytes from 0x0 to 0x10000000 would take "
        "256 MiB",
        FailureOf([&] { FormatImage(far, Format::Binary); }));
    EXPECT_EQ("2: ELF can't be made from memory contents",
              FailureOf([&] { FormatImage(far, Format::Elf); }));
}

// --- Files and other tools

TEST(ImageFiles, AgreeWithOtherTools) {
    const test::TemporaryDirectory directory;
    std::mt19937 random(2);
    Image sparse;
    for (std::uint32_t i = 0; i < 40; ++i) {
        Bytes bytes(1 + random() % 3000);
        for (std::uint8_t& byte : bytes)
            byte = static_cast<std::uint8_t>(random());
        sparse.Add(i * 25000 + static_cast<std::uint32_t>(random() % 20000), bytes, "test");
    }
    Bytes flat(0x100000, 0xFF);
    for (const Section& section : sparse.Sections()) {
        std::ranges::copy(section.bytes, flat.begin() + section.address);
    }
    const Image filled = MakeImage({{0, flat}});
    directory.Write("in.hex", FormatImage(sparse, Format::IntelHex));
    directory.Write("in.srec", FormatImage(sparse, Format::SRecord));

    const std::pair<std::string, const Image&> cases[] = {
        {"srec_cat in.hex -intel -o out -motorola", sparse},
        {"srec_cat in.hex -intel -o out -motorola -address-length=3 -line-length=200", sparse},
        {"srec_cat in.srec -o out -intel -line-length=500", sparse},
        {"srec_cat in.srec -o out -intel -address-length=3", sparse},
        {"srec_cat in.hex -intel -fill 0xFF 0 0x100000 -o out -binary", filled},
        {"srec_cat in.srec -fill 0xFF 0 0x100000 -o out -binary", filled},
        {"mkfifo out && (cat in.hex > out &)", sparse},  // whose size isn't known
        {"objcopy -I ihex -O srec in.hex out", sparse},
        {"objcopy -I srec -O ihex in.srec out", sparse},
    };
    for (const auto& [command, image] : cases) {
        ASSERT_EQ(0, std::system(("cd '" + directory.Path().string() + "' && " + command).c_str()));
        EXPECT_TRUE(image == ReadImageFile(directory.File("out"), {{}, 0}).image) << command;
        std::filesystem::remove(directory.File("out"));
    }
}

TEST(ImageFiles, OfARealFirmwareAreEqualInAllFormats) {
    const std::string firmware = FIRMWARE_DIRECTORY "/firmware";
    const Image image = ReadImageFile(firmware + ".bin", {{}, 0}).image;
    EXPECT_EQ(4568U, image.ByteCount());
    EXPECT_EQ(image, ReadImageFile(firmware + ".elf", {}).image);
    EXPECT_EQ(image, ReadImageFile(firmware + ".ihex", {}).image);
}

TEST(ImageFiles, AreDumpedForPeople) {
    const Image image = MakeImage({{0x400, Bytes(36, ' ')}, {0x500, {'~', 0x7F, 0x1F, 'A'}}});
    EXPECT_EQ(
        "00000400  20 20 20 20 20 20 20 20  20 20 20 20 20 20 20 20  |                |\n*\n"
        "00000420  20 20 20 20                                       |    |\n"
        "00000500  7e 7f 1f 41                                       |~..A|\n",
        FormatDump(image));
}

TEST(ImageFiles, SayWhyTheyCannotBeRead) {
    const test::TemporaryDirectory directory;
    const std::string path = directory.Path();
    EXPECT_EQ("3: can't read the image file " + path + ": Is a directory",
              FailureOf([&] { ReadImageFile(path, {}); }));
    EXPECT_EQ("3: can't read the image file " + path + "/x: No such file or directory",
              FailureOf([&] { ReadImageFile(path + "/x", {}); }));
}

}  // namespace
}  // namespace host::image
