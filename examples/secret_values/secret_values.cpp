// Keeps a secret value (a password in a configuration file, say) as
// printable text, and reads stored values whether or not they were
// encrypted.
#include <cstdio>
#include <cstring>

#include "tessaline/crypt/rvEncrypt.h"

namespace {

// Room for the marked text of `length` bytes: n blocks of 32 hex digits,
// "D9", "AB" and the NUL.
constexpr unsigned long markedSize(unsigned long length)
{
    return 32 * (((length + 3) >> 4) + 1) + 5;
}

// What a host does with a stored value: decrypt it if it is encrypted,
// take it as it is if not. The caller learns which it was.
void readStored(const char* label, const char* stored)
{
    char text[256];
    std::snprintf(text, sizeof text, "%s", stored);
    unsigned char value[128];
    unsigned long length = sizeof value - 1;  // capacity; one byte kept for the NUL
    unsigned int wasPlain = 0;
    if (rvDecrypt(text, value, &length, &wasPlain) == 0) {
        std::printf("%-10s unreadable\n", label);
        return;
    }
    value[length] = '\0';
    std::printf("%-10s \"%s\" (%lu bytes, %s)\n", label, reinterpret_cast<char*>(value), length,
                wasPlain != 0 ? "clear text" : "was encrypted");
}

}  // namespace

int main()
{
    unsigned char password[] = "correct horse battery staple";
    constexpr unsigned long length = sizeof password - 1;

    char marked[markedSize(length)];
    if (rvEncrypt(password, length, marked) == 0) {
        std::printf("rvEncrypt failed\n");
        return 1;
    }
    // The key is fixed, so one value always gives the same text.
    std::printf("rvEncrypt(\"%s\")\n  = %s\n  (%zu characters for %lu bytes)\n\n", password, marked,
                std::strlen(marked), length);

    readStored("encrypted", marked);
    readStored("clear", "hunter2");

    // With a key of the host's own: 32 hex digits (128 bits) or 64 (256).
    char key[] = "00112233445566778899AABBCCDDEEFF";
    unsigned char note[] = "meet at noon";
    char hex[2 * 32 + 1];
    TwoFishEncrypt(key, note, std::strlen(reinterpret_cast<char*>(note)), hex);
    std::printf("\nTwoFishEncrypt with the host's key\n  = %s\n", hex);

    unsigned char back[64];
    unsigned long backLength = sizeof back - 1;
    TwoFishDecrypt(key, hex, back, &backLength);
    back[backLength] = '\0';
    std::printf("TwoFishDecrypt gives \"%s\"\n", reinterpret_cast<char*>(back));

    // There is no integrity check: a wrong key "succeeds" with other bytes.
    char wrongKey[] = "FFEEDDCCBBAA99887766554433221100";
    backLength = sizeof back - 1;
    const int status = TwoFishDecrypt(wrongKey, hex, back, &backLength);
    std::printf("with a wrong key: status %d, same text: %s\n", status,
                backLength == std::strlen(reinterpret_cast<char*>(note)) && std::memcmp(back, note, backLength) == 0
                    ? "yes"
                    : "no");
    return 0;
}
