// What the two text layers share: key set-up from hex text, the fixed text
// key's schedule, and the record to hex text and back under a ready key.
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

// The schedule of the fixed key, built at the first call (safe when threads
// meet it at once) and never changed afterwards. Serves both directions
// through CipherBlocks.
const keyInstance& FixedKeySchedule();

// TwoFishEncrypt under a key already set up.
int EncryptToText(const keyInstance& key, const unsigned char* data, unsigned long length, char* out);

// TwoFishDecrypt under a key already set up, on the first textLength
// characters of `text`, which need not be terminated there.
int DecryptText(const keyInstance& key, const char* text, std::size_t textLength, unsigned char* out,
                unsigned long* length);

// The byte a pair of characters stands for: hex digits directly, anything
// else as strtoul in base 16 reads the pair (low 8 bits).
unsigned char PairValue(const char* pair);

}  // namespace tessaline::crypt

#endif
