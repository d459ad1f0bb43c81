// A C program that uses the installed library. Exits 0 when the check value of CRC-32/MPEG-2 is
// right.
#include <Varnek_Util.h>
#include <stdio.h>

int main(void) {
    const uint32_t crc = VarnekUtil_MakeCRC32((const unsigned char *)"123456789", 9);
    printf("C: CRC 0x%08X\n", (unsigned)crc);
    return crc == 0x0376E6E7u ? 0 : 1;
}
