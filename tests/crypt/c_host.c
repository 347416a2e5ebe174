/* A C host of the plain-named interface. */
#include <string.h>

#include "tessaline/crypt/rvEncrypt.h"
#include "tessaline/crypt/twofish.h"

int CHostRoundTrip(void)
{
    keyInstance key;
    cipherInstance cipher;
    unsigned char block[BLOCK_SIZE / 8] = {0};
    unsigned char data[] = "from C";
    char text[64];
    unsigned char out[16];
    unsigned long length = sizeof out;
    unsigned int wasPlain = 1;

    memset(&key, 0, sizeof key);
    if (makeKey(&key, DIR_ENCRYPT, 128, NULL) != TRUE || reKey(&key) != TRUE ||
        cipherInit(&cipher, MODE_ECB, NULL) != TRUE)
        return 0;
    blockEncrypt(&cipher, &key, block, BLOCK_SIZE, block);
    if (block[0] != 0xA2 || block[15] != 0xAE)
        return 0;
    if (!RVUI_Encrypt(data, 6, text) || !RVUI_Decrypt(text, out, &length, &wasPlain))
        return 0;
    return length == 6 && wasPlain == 0 && memcmp(out, data, 6) == 0;
}
