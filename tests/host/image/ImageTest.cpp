// Image files: what the readers make of good and of bad files, measured against other tools where
// they know the format, and that what is written can be read again.

#include "host/image/Image.h"

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <map>
#include <random>

#include "host/base/Errors.h"
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

/// What a Failure says is wrong: its text without the advice behind the semicolon.
template <typename Work>
std::string FailureOf(Work work, ExitStatus expected = ExitStatus::BadFile) {
    try {
        work();
    } catch (const Failure& failure) {
        EXPECT_EQ(expected, failure.Status());
        const std::string text = failure.what();
        return text.substr(0, text.find(';'));
    }
    return "no failure";
}

std::string Complaint(const std::string& contents, const ReadOptions& options = {},
                      ExitStatus expected = ExitStatus::BadFile) {
    return FailureOf([&] { ParseImage(contents, "f", options); }, expected);
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
    EXPECT_EQ("b.elf puts 0x09 at address 0x12, where 0x03 stands already",
              FailureOf([&] { image.Add(0x0F, different, "b.elf"); }));
    EXPECT_EQ("b.elf: 3 bytes at address 0xfffffffe run past 0xffffffff",
              FailureOf([&] { image.Add(0xFFFFFFFE, tooLong, "b.elf"); }));
    FailureOf([&] { image.Add(MakeImage({{0, {1}}, {0x11, {3}}}), "b.elf"); });
    EXPECT_EQ(before, image);
    image.Add(MakeImage({{0, {1}}, {0x11, {2}}, {0x13, {3}}}), "b.elf");
    EXPECT_EQ(MakeImage({{0, {1}}, {0x10, {1, 2, 3, 3}}, {0xFFFFFFFE, {4, 5}}}), image);
}

TEST(ImageFile, ReadsWhatTheTextFormatsAllow) {
    const std::pair<std::string, Image> cases[] = {
        {"\r\n :0200000001a25B \r\n\n:00001000F0\n:00000001FF\t", MakeImage({{0, {1, 0xA2}}})},
        {":020000021000EC\n:020000040001F9\n:04FFFE0001020304F5\n:0400000500000001F6\n:"
         "00000001FF\n",
         MakeImage({{0x1FFFE, {1, 2, 3, 4}}})},
        {":020000021000EC\n:04FFFE0001020304F5\n:0400000300000001F8\n:00000001FF\n",
         MakeImage({{0x10000, {3, 4}}, {0x1FFFE, {1, 2}}})},
        {":04FFFE0001020304F5\n:00000001FF\n", MakeImage({{0xFFFE, {1, 2, 3, 4}}})},
        {":02000004FFFFFC\n:04FFFE0001020304F5\n:00000001FF\n",
         MakeImage({{0, {3, 4}}, {0xFFFFFFFE, {1, 2}}})},
        {"S00600004844521B\r\nS104001001EA\nS205123456025C\nS3061234567803E2\nS5030003F9\n"
         "S604000003F8\nS70500000000FA",
         MakeImage({{0x10, {1}}, {0x123456, {2}}, {0x12345678, {3}}})},
        {"S104001001EA\nS1030000FC\nS5030002FA\n", MakeImage({{0x10, {1}}})},
    };
    for (const auto& [contents, image] : cases)
        EXPECT_EQ(image, ParseImage(contents, "f", {}));
}

TEST(ImageFile, NamesFileAndLineOfWhatIsWrong) {
    const std::pair<std::string, std::string> cases[] = {
        {"", "f: the file is empty"},
        {"MZ", "f: no known format found (ELF, Intel HEX, S-record)"},
        {":00000001FF", "f: no bytes to load found (read as ihex)"},
        {"\n:0200000001A25C", "f: line 2: checksum 0x5C found, 0x5B expected"},
        {":020000000102", "f: line 1: a record of 6 bytes found, 7 expected by its length byte"},
        {":0200000001A25", "f: line 1: 13 hexadecimal digits found, pairs expected"},
        {":02000\x01", "f: line 1: byte 0x01 found in column 7, a hexadecimal digit expected"},
        {":" + std::string(600, '0'), "f: line 1: 601 characters found, more than any record has"},
        {":0200000001A25B\n", "f: no end record (:00000001FF) found"},
        {":00000001FF\n:00000001FF", "f: line 2: more text found behind the end record"},
        {":00000006FA", "f: line 1: record type 06 found, 00 to 05 expected"},
        {":0100000401FA", "f: line 1: length 1 found, 2 expected in a record of type 04"},
        {":0200000001A25B\n:0200000001A25B\n:0100010003FB\n:00000001FF",
         "f: line 3 puts 0x03 at address 0x1, where 0xa2 stands already"},
        {"S104001001EB", "f: line 1: checksum 0xEB found, 0xEA expected"},
        {"S104001001EA\nS5030002FA", "f: line 2: data records: 1 found, 2 expected by this count"},
        {"S5030000FC\nS104001001EA",
         "f: neither a count (S5, S6) nor a termination record (S7 to S9) found behind the data"},
        {"S9030000FC\nS9030000FC", "f: line 2: more text found behind the termination record"},
        {"S904000001FA", "f: line 1: address and data: 3 bytes found, 2 expected in an S9 record"},
        {"S4030000FC", "f: line 1: a line found that begins with none of S0 to S3 and S5 to S9"},
        {"S307FFFFFFFF0102F9\nS9030000FC",
         "f: line 1: 2 bytes at address 0xffffffff run past 0xffffffff"},
    };
    for (const auto& [contents, text] : cases)
        EXPECT_EQ(text, Complaint(contents));
    EXPECT_EQ("f: no ELF header found", Complaint("hello", {Format::Elf, {}}));
    EXPECT_EQ("f: line 1: a line found that begins with none of S0 to S3 and S5 to S9",
              Complaint("SA030000FC", {Format::SRecord, {}}));
    EXPECT_EQ("f: line 1: no ':' found at the beginning, where each record of Intel HEX has one",
              Complaint("hello", {Format::IntelHex, {}}));
}

TEST(ImageFile, NeedsABaseForRawBinary) {
    EXPECT_EQ(MakeImage({{0x8000, {'M', 'Z'}}}), ParseImage("MZ", "f", {{}, 0x8000}));
    EXPECT_EQ(MakeImage({{1, {':', '0'}}}), ParseImage(":0", "f", {Format::Binary, 1}));
    EXPECT_EQ("f: raw binary has no address of its own",
              Complaint(":0", {Format::Binary, {}}, ExitStatus::WrongUsage));
    EXPECT_EQ("f: 2 bytes at address 0xffffffff run past 0xffffffff",
              Complaint("MZ", {{}, 0xFFFFFFFF}));
}

// --- ELF

struct Segment {
    std::uint32_t type;
    std::uint64_t offset, address, fileSize;
};

/// A 32-bit little-endian ELF file of a type (2: an executable) with these segments, and `bytes`
/// behind its tables.
std::string MakeElf(const std::vector<Segment>& segments, const std::string& bytes, int type = 2) {
    std::string elf{0x7F, 'E', 'L', 'F', 1, 1, 1};
    elf.resize(16);
    const std::uint64_t headerSize = 52;
    const std::uint64_t entrySize = 32;
    const auto put = [&](std::uint64_t value, int size) {
        for (int i = 0; i < size; ++i)
            elf += static_cast<char>(value >> 8 * i);
    };
    put(static_cast<std::uint64_t>(type), 2), put(40, 2), put(1, 4), put(0, 4);
    put(headerSize, 4), put(0, 4), put(0, 4), put(headerSize, 2), put(entrySize, 2);
    put(segments.size(), 2), put(0, 6);
    for (const auto& [kind, offset, address, fileSize] : segments) {
        put(kind, 4), put(headerSize + segments.size() * entrySize + offset, 4);
        put(0x20000000, 4), put(address, 4), put(fileSize, 4), put(fileSize + 8, 4);
        put(5, 4), put(4, 4);
    }
    return elf + bytes;
}

TEST(ImageFile, LoadsElfSegmentsWithBytesAtTheirPhysicalAddresses) {
    const std::vector<Segment> segments{
        {1, 0, 0x8000, 3}, {1, 0, 0x20000000, 0}, {6, 0, 0x30, 1}, {1, 3, 0xFFFFFFFF, 1}};
    EXPECT_EQ(MakeImage({{0x8000, {'a', 'b', 'c'}}, {0xFFFFFFFF, {'d'}}}),
              ParseImage(MakeElf(segments, "abcd"), "f", {}));
}

TEST(ImageFile, RefusesElfFilesThatAreCutOffOrUnfit) {
    const std::vector<Segment> segments{{1, 0, 0x8000, 4}};
    const std::string whole = MakeElf(segments, "abcd");
    std::string badEntrySize = whole, noSections = whole, bigEndian = whole;
    badEntrySize[42] = 40;
    noSections[32] = 61, noSections[46] = 40, noSections[48] = 1;  // offset, entry size and count
    bigEndian[5] = 2, bigEndian[16] = 0, bigEndian[17] = 2, bigEndian[23] = 1;
    bigEndian.replace(28, 20, 20, 0);
    std::string otherMachine = whole, moreInFile = whole;
    otherMachine[18] = 62, moreInFile[72] = 3;
    const std::string expected = " found, a 32-bit little-endian executable expected";
    const std::pair<std::string, std::string> cases[] = {
        {whole.substr(0, 30),
         "f: ELF header: 52 bytes expected at offset 0, but the file ends at 30"},
        {whole.substr(0, 70),
         "f: program header table: 32 bytes expected at offset 52, but the file ends at 70"},
        {whole.substr(0, 87),
         "f: segment 0: 4 bytes expected at offset 84, but the file ends at 87"},
        {badEntrySize, "f: program header table: entries of 40 bytes found, 32 expected"},
        {noSections,
         "f: section header table: 40 bytes expected at offset 61, but the file ends at 88"},
        {MakeElf({{1, 0, 0, 0}}, ""), "f: no bytes to load found (read as elf)"},
        {MakeElf({{1, 0, 8, 2}, {1, 1, 9, 1}, {1, 0, 9, 1}}, "ab"),
         "f: segment 2 puts 0x61 at address 0x9, where 0x62 stands already"},
        {MakeElf(segments, "abcd", 1), "f: a relocatable object" + expected},
        {MakeElf(segments, "abcd", 3),
         "f: a shared object or a position-independent program" + expected},
        {MakeElf(segments, "abcd", 4), "f: a core" + expected},
        {MakeElf(segments, "abcd", 9), "f: a file of type 9" + expected},
        {bigEndian, "f: an executable, big-endian" + expected},
        {otherMachine, "f: an executable, for another machine than Arm (62)" + expected},
        {moreInFile, "f: segment 0: 4 bytes in the file, but 3 in memory"},
    };
    for (const auto& [contents, text] : cases)
        EXPECT_EQ(text, Complaint(contents));
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
        "raw binary: the gaps filled, the bytes from 0x0 to 0x10000000 would take "
        "256 MiB",
        FailureOf([&] { FormatImage(far, Format::Binary); }, ExitStatus::WrongUsage));
    EXPECT_EQ("ELF can't be made from memory contents",
              FailureOf([&] { FormatImage(far, Format::Elf); }, ExitStatus::WrongUsage));
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

TEST(ImageFiles, SayWhyTheyCannotBeRead) {
    const test::TemporaryDirectory directory;
    const std::string path = directory.Path();
    EXPECT_EQ("can't read the image file " + path + ": Is a directory",
              FailureOf([&] { ReadImageFile(path, {}); }));
    EXPECT_EQ("can't read the image file " + path + "/x: No such file or directory",
              FailureOf([&] { ReadImageFile(path + "/x", {}); }));
}

}  // namespace
}  // namespace host::image
