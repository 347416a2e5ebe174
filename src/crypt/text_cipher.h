// Internals of the text encryption shared by its two layers and the tests.
#ifndef TESSALINE_SRC_CRYPT_TEXT_CIPHER_H
#define TESSALINE_SRC_CRYPT_TEXT_CIPHER_H

#include <cstddef>

#include "tessaline/crypt/twofish.h"

namespace tessaline::crypt {

// Clears both instances (the S-box tables only where reKey will not fill
// them) and keys them for `direction` (0 encrypt, 1 decrypt) from
// keyBits / 32 groups of 8 hex digits of keyText (at most 8 groups;
// a group ends early at the text's NUL). Returns 1, or 0 for a null pointer
// or a refusal of the engine.
int TwoFishKeySetup(keyInstance* key, cipherInstance* cipher, unsigned char direction, char* keyText, int keyBits);

// Copies the fixed key text and its NUL into `buffer` (33 characters); a
// null buffer is ignored.
void TwoFishFixedKey(char* buffer);

constexpr std::size_t kFixedKeyBuffer = 33;

// The byte a pair of characters stands for: hex digits directly, anything
// else as strtoul in base 16 reads the pair (low 8 bits).
unsigned char PairValue(const char* pair);

// TwoFishDecrypt on the first textLength characters of `text`, which need
// not be terminated there.
int DecryptHexText(char* keyText, const char* text, std::size_t textLength, unsigned char* out, unsigned long* length);

}  // namespace tessaline::crypt

#endif
