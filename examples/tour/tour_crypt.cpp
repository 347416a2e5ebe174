#include <cstdio>
#include <cstring>

#include "tessaline/tessaline.h"
#include "tour.h"

namespace {

// Reads a stored value that may or may not have been encrypted.
void ShowDecrypted(const char* label, char* stored)
{
    unsigned char value[64];
    unsigned long length = sizeof value - 1;
    unsigned int wasPlain = 0;
    const int ok = rvDecrypt(stored, value, &length, &wasPlain);
    value[length] = '\0';
    std::printf("%s: rvDecrypt -> %d, \"%s\" (%lu bytes, wasPlain %u)\n", label, ok, reinterpret_cast<char*>(value),
                length, wasPlain);
}

}  // namespace

void TourCrypt()
{
    std::printf("\n== Text encryption ==\n");
    unsigned char secret[] = "s3cret passw0rd";
    const unsigned long length = std::strlen(reinterpret_cast<char*>(secret));
    // Two blocks of hex digits (32 each) between "D9" and "AB", and a NUL.
    char marked[2 * 32 + 5];
    rvEncrypt(secret, length, marked);
    std::printf("rvEncrypt(\"%s\") = %s\n", secret, marked);
    ShowDecrypted("marked text", marked);
    char clear[] = "plain value";
    ShowDecrypted("clear text ", clear);
}
