// A C++ program that uses the installed library. Exits 0 when it computes the check value of
// CRC-32/MPEG-2 and reads it back as bits.
#include <Varnek_CBitInputStream.h>
#include <Varnek_Util.h>

#include <cstdio>

int main() {
    const unsigned char text[] = "123456789";
    const uint32_t crc = VarnekUtil_MakeCRC32(text, 9);
    unsigned char bytes[] = {static_cast<unsigned char>(crc >> 24), static_cast<unsigned char>(crc >> 16),
                             static_cast<unsigned char>(crc >> 8), static_cast<unsigned char>(crc)};
    VarnekCBitInputStream bits(bytes, sizeof bytes, 0);
    unsigned char success = 1;
    const unsigned int value = bits.ReadInt(32, success);
    std::printf("C++: CRC 0x%08X\n", value);
    return success == 1 && value == 0x0376E6E7u ? 0 : 1;
}
