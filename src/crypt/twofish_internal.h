// What the engine's key schedule, its block code and the text forms share.
// Bytes of a word are numbered from the most significant end: byte 0 is
// bits 31-24.
#ifndef TESSALINE_SRC_CRYPT_TWOFISH_INTERNAL_H
#define TESSALINE_SRC_CRYPT_TWOFISH_INTERNAL_H

#include <stdint.h>

#include "tessaline/crypt/twofish.h"

namespace tessaline::crypt {

constexpr int kRoundSubkeyPairs = 16;
constexpr int kWhiteningWords = 8;
constexpr int kMaxRounds = 16;

constexpr int ByteShift(int byteIndex)
{
    return 24 - 8 * byteIndex;
}

constexpr uint32_t ByteOf(uint32_t word, int byteIndex)
{
    return (word >> ByteShift(byteIndex)) & 0xFF;
}

constexpr uint32_t RotateLeft(uint32_t x, int n)
{
    return (x << n) | (x >> (32 - n));
}
constexpr uint32_t RotateRight(uint32_t x, int n)
{
    return (x >> n) | (x << (32 - n));
}

// Rounds a key instance runs, held to what subKeys has room for.
inline int RoundsOf(const keyInstance* key)
{
    const int rounds = key->numRounds;
    if (rounds < 0)
        return 0;
    return rounds > kMaxRounds ? kMaxRounds : rounds & ~1;
}

enum class Direction { kEncrypt, kDecrypt };

// Swaps the 16 round subkey pairs of `subKeys` end for end.
void ReverseRoundPairs(uint32_t* subKeys);

// Code-book mode over `blocks` whole blocks from `in` to `out` (which may be
// `in` itself). Unlike blockEncrypt and blockDecrypt this never writes the
// key: a key turned for the other direction is turned on a copy of its
// subkeys, so one schedule can serve any number of threads in both
// directions.
void CipherBlocks(Direction direction, const keyInstance& key, const unsigned char* in, long blocks,
                  unsigned char* out);

}  // namespace tessaline::crypt

#endif
