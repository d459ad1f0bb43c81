// A C program that uses the installed library. Exits 0 when headers and package have one version and the
// check value of CRC-32/MPEG-2 is right.
#include <Varnek_Util.h>
#include <Varnek_Version.h>
#include <stdio.h>
#include <string.h>

int main(void) {
    char version[32];
    snprintf(version, sizeof version, "%d.%d.%d", VARNEK_VERSION_MAJOR, VARNEK_VERSION_MINOR, VARNEK_VERSION_PATCH);
    const uint32_t crc = VarnekUtil_MakeCRC32((const unsigned char *)"123456789", 9);
    printf("C: version %s, CRC 0x%08X\n", version, (unsigned)crc);
    return strcmp(version, EXPECTED_VERSION) == 0 && crc == 0x0376E6E7u ? 0 : 1;
}
