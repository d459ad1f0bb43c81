// Compares the CRC with its definition by bits, and uses it on sections and files.
#include "Varnek_Util.h"

#include <unistd.h>

#include "support/VarnekTest.h"

namespace {

using ::testing::ElementsAre, ::testing::SizeIs, ::testing::StartsWith;

class Util : public VarnekTest {};

std::mt19937 gRandom(13818);

uint32_t CrcByBits(const unsigned char *data, size_t length) {
    uint32_t crc = 0xFFFFFFFF;
    for (size_t bit = 0; bit < length * 8; ++bit) {
        const uint32_t in = data[bit / 8] >> (7 - bit % 8) & 1;
        crc = crc << 1 ^ ((crc >> 31 ^ in) != 0 ? 0x04C11DB7 : 0);
    }
    return crc;
}

TEST_F(Util, CrcIsTheDefinitionAtEveryLengthAndAlignment) {
    const unsigned char digits[] = "123456789";
    EXPECT_EQ(VarnekUtil_MakeCRC32(digits, 9), 0x0376E6E7u);
    for (size_t length = 0; length <= 300; ++length) {
        for (size_t offset = 0; offset < 16; ++offset) {
            const auto bytes = RandomBytes(gRandom, offset + length);
            const unsigned char *data = bytes.data() + offset;
            ASSERT_EQ(VarnekUtil_MakeCRC32(data, static_cast<int32_t>(length)), CrcByBits(data, length))
                << length << " bytes at " << offset;
            ASSERT_THAT(TakeBodies("Varnek"), SizeIs(length < 4 ? 1 : 0));
        }
    }
    for (const int32_t length : {-5, 0, 100}) {
        EXPECT_EQ(VarnekUtil_MakeCRC32(nullptr, length), 0xFFFFFFFFu);
        EXPECT_THAT(TakeBodies("Varnek"), SizeIs(1));
    }
}

TEST_F(Util, AFlippedBitInvalidatesASection) {
    EXPECT_EQ(VarnekUtil_CheckSectionCRC32(nullptr), FALSE);
    EXPECT_THAT(TakeBodies("Varnek"), SizeIs(1));
    for (const size_t size : {7u, 40u, 4098u}) {
        auto section = RandomBytes(gRandom, size);
        section[1] = static_cast<unsigned char>((section[1] & 0xF0) | (size - 3) >> 8);
        section[2] = static_cast<unsigned char>(size - 3);
        const uint32_t crc = CrcByBits(section.data(), size - 4);
        for (size_t i = 0; i < 4; ++i) {
            section[size - 4 + i] = static_cast<unsigned char>(crc >> (24 - 8 * i));
        }
        EXPECT_EQ(VarnekUtil_CheckSectionCRC32(section.data()), TRUE) << size;
        for (size_t bit = 0; bit < size * 8; bit += size < 100 ? 1 : 499) {
            if (bit >= 12 && bit < 24) {
                continue;  // the length itself
            }
            auto broken = section;
            broken[bit / 8] = static_cast<unsigned char>(broken[bit / 8] ^ 0x80 >> bit % 8);
            EXPECT_EQ(VarnekUtil_CheckSectionCRC32(broken.data()), FALSE) << bit;
            EXPECT_THAT(TakeBodies(), ElementsAre(StartsWith("CRC32 Invalid! calculated crc32=[0x")));
        }
    }
}

TEST_F(Util, AFileCarriesItsCrc) {
    const std::string path = Path("file");
    WriteAll(path, "1234");
    NOTE(VarnekUtil_AppendCRC32ToFile)(path);
    NOTE(VarnekUtil_CheckFileCRC32)(path);
    EXPECT_EQ(ReadAll(path), "1234\xa6\x95\xc4\xaa");
    EXPECT_EQ(VarnekUtil_AppendCRC32ToFile(path.c_str()), TRUE);
    EXPECT_EQ(VarnekUtil_CheckFileCRC32(path.c_str()), TRUE);
    EXPECT_EQ(ReadAll(path).substr(8), std::string(4, '\0'));
    WriteAll(path, "1235\xa6\x95\xc4\xaa");
    EXPECT_EQ(VarnekUtil_CheckFileCRC32(path.c_str()), FALSE);
}

TEST_F(Util, FilesThatCannotCarryACrcAreRefused) {
    const std::string path = Path("file");
    EXPECT_EQ(VarnekUtil_CheckFileCRC32(path.c_str()), FALSE);
    EXPECT_EQ(VarnekUtil_AppendCRC32ToFile(nullptr), FALSE);
    WriteAll(path, "1234567");
    NOTE(VarnekUtil_CheckFileCRC32)(path);
    WriteAll(path, "123");
    NOTE(VarnekUtil_AppendCRC32ToFile)(path);
    EXPECT_EQ(ReadAll(path), "123");
    // The kernel reports the size of a page for this file, which has only a line.
    const char *line = "/sys/devices/system/cpu/online";
    if (access(line, R_OK) == 0) {
        for (const auto operation : {VarnekUtil_CheckFileCRC32, VarnekUtil_AppendCRC32ToFile}) {
            EXPECT_EQ(operation(line), FALSE);
            EXPECT_EQ(TakeBodies().back(), "File Reading Fail!\n");
        }
    }
}

}  // namespace
