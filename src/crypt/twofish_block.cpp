// Block encryption and decryption of the engine: ECB and CBC over whole
// blocks, and the CFB1 bit loop on top of ECB.
#include <cstring>

#include "crypt/twofish_internal.h"

using namespace tessaline_crypt;

namespace {

constexpr int kBlockBytes = BLOCK_SIZE / 8;
constexpr int kSubkeyWords = kWhiteningWords + 2 * kRoundSubkeyPairs;

#define TESSALINE_ALWAYS_INLINE inline __attribute__((always_inline))

TESSALINE_ALWAYS_INLINE uint32_t loadBigEndian(const unsigned char* p)
{
    uint32_t word;
    std::memcpy(&word, p, sizeof word);
    return __builtin_bswap32(word);
}

TESSALINE_ALWAYS_INLINE void storeBigEndian(unsigned char* p, uint32_t word)
{
    word = __builtin_bswap32(word);
    std::memcpy(p, &word, sizeof word);
}

// g of a word, byte j of the input (bits 31-8j downwards) indexing table j.
TESSALINE_ALWAYS_INLINE uint32_t g(const uint32_t* s, uint32_t x)
{
    return s[2 * (x >> 24)] ^ s[2 * ((x >> 16) & 0xFF) + 1] ^ s[512 + 2 * ((x >> 8) & 0xFF)] ^
           s[513 + 2 * (x & 0xFF)];
}

// g of the second round input, whose bytes are taken in the order 3, 0, 1, 2.
TESSALINE_ALWAYS_INLINE uint32_t gRotated(const uint32_t* s, uint32_t x)
{
    return s[2 * (x & 0xFF)] ^ s[2 * (x >> 24) + 1] ^ s[512 + 2 * ((x >> 16) & 0xFF)] ^
           s[513 + 2 * ((x >> 8) & 0xFF)];
}

struct Block {
    uint32_t w[4];
};

// Both directions take the round subkeys from the end of the array: a key
// turned for encryption holds them last first.
TESSALINE_ALWAYS_INLINE void encryptWords(const uint32_t* s, const uint32_t* k, int rounds, Block& b)
{
    uint32_t x0 = b.w[0] ^ k[0], x1 = b.w[1] ^ k[1], x2 = b.w[2] ^ k[2], x3 = b.w[3] ^ k[3];
    const uint32_t* roundKey = k + kSubkeyWords - 2;
    for (int r = 0; r < rounds; r += 2, roundKey -= 4) {
        uint32_t t0 = g(s, x0);
        uint32_t t1 = gRotated(s, x1);
        x2 = rotateRight(x2 ^ (t0 + t1 + roundKey[0]), 1);
        x3 = rotateLeft(x3, 1) ^ (t0 + 2 * t1 + roundKey[1]);
        t0 = g(s, x2);
        t1 = gRotated(s, x3);
        x0 = rotateRight(x0 ^ (t0 + t1 + roundKey[-2]), 1);
        x1 = rotateLeft(x1, 1) ^ (t0 + 2 * t1 + roundKey[-1]);
    }
    b.w[0] = x2 ^ k[4];
    b.w[1] = x3 ^ k[5];
    b.w[2] = x0 ^ k[6];
    b.w[3] = x1 ^ k[7];
}

TESSALINE_ALWAYS_INLINE void decryptWords(const uint32_t* s, const uint32_t* k, int rounds, Block& b)
{
    uint32_t x0 = b.w[0] ^ k[4], x1 = b.w[1] ^ k[5], x2 = b.w[2] ^ k[6], x3 = b.w[3] ^ k[7];
    const uint32_t* roundKey = k + kWhiteningWords + 2 * (rounds - 1);
    for (int r = 0; r < rounds; r += 2, roundKey -= 4) {
        uint32_t t0 = g(s, x0);
        uint32_t t1 = gRotated(s, x1);
        x2 = rotateLeft(x2, 1) ^ (t0 + t1 + roundKey[0]);
        x3 = rotateRight(x3 ^ (t0 + 2 * t1 + roundKey[1]), 1);
        t0 = g(s, x2);
        t1 = gRotated(s, x3);
        x0 = rotateLeft(x0, 1) ^ (t0 + t1 + roundKey[-2]);
        x1 = rotateRight(x1 ^ (t0 + 2 * t1 + roundKey[-1]), 1);
    }
    b.w[0] = x2 ^ k[0];
    b.w[1] = x3 ^ k[1];
    b.w[2] = x0 ^ k[2];
    b.w[3] = x1 ^ k[3];
}

TESSALINE_ALWAYS_INLINE Block loadBlock(const unsigned char* p)
{
    return Block{{loadBigEndian(p), loadBigEndian(p + 4), loadBigEndian(p + 8), loadBigEndian(p + 12)}};
}

TESSALINE_ALWAYS_INLINE void storeBlock(unsigned char* p, const Block& b)
{
    for (int i = 0; i < 4; ++i)
        storeBigEndian(p + 4 * i, b.w[i]);
}

enum class Direction { kEncrypt, kDecrypt };

template <Direction D>
TESSALINE_ALWAYS_INLINE void runBlocks(const uint32_t* s, const uint32_t* k, int rounds, bool chained,
                                       uint32_t* chain, const unsigned char* in, int inputLen,
                                       unsigned char* out)
{
    for (int n = 0; n < inputLen; n += BLOCK_SIZE, in += kBlockBytes, out += kBlockBytes) {
        Block b = loadBlock(in);
        if (D == Direction::kEncrypt) {
            for (int i = 0; i < 4; ++i)
                b.w[i] ^= chain[i];
            encryptWords(s, k, rounds, b);
            if (chained)
                std::memcpy(chain, b.w, sizeof b.w);
        } else {
            const Block cipherWords = b;
            decryptWords(s, k, rounds, b);
            for (int i = 0; i < 4; ++i)
                b.w[i] ^= chain[i];
            if (chained)
                std::memcpy(chain, cipherWords.w, sizeof cipherWords.w);
        }
        storeBlock(out, b);
    }
}

// The one-bit feedback loop: each bit is combined with the top bit of the
// enciphered feedback register, which then shifts left taking in the
// cipher-text bit.
int runCfb1(cipherInstance* cipher, keyInstance* key, const unsigned char* input, int inputLen,
            unsigned char* out, Direction direction)
{
    cipher->mode = MODE_ECB;
    for (int n = 0; n < inputLen; ++n) {
        unsigned char keystream[kBlockBytes];
        blockEncrypt(cipher, key, cipher->IV, BLOCK_SIZE, keystream);
        const unsigned char mask = static_cast<unsigned char>(0x80 >> (n & 7));
        const unsigned inBit = (input[n / 8] & mask) ? 1 : 0;
        const unsigned outBit = inBit ^ (keystream[0] >> 7);
        out[n / 8] = static_cast<unsigned char>((out[n / 8] & ~mask) | (outBit ? mask : 0));
        unsigned carry = direction == Direction::kEncrypt ? outBit : inBit;
        for (int i = kBlockBytes - 1; i >= 0; --i) {
            const unsigned top = cipher->IV[i] >> 7;
            cipher->IV[i] = static_cast<unsigned char>((cipher->IV[i] << 1) | carry);
            carry = top;
        }
    }
    cipher->mode = MODE_CFB1;
    return inputLen;
}

template <Direction D>
int process(cipherInstance* cipher, keyInstance* key, const unsigned char* input, int inputLen,
            unsigned char* out)
{
    if (cipher == nullptr || key == nullptr || (inputLen > 0 && (input == nullptr || out == nullptr)))
        return 0;
    if (cipher->mode == MODE_CFB1)
        return runCfb1(cipher, key, input, inputLen, out, D);

    const unsigned char direction = D == Direction::kEncrypt ? DIR_ENCRYPT : DIR_DECRYPT;
    if (key->direction != direction)
        ReverseRoundSubkeys(key, direction);

    uint32_t subkeys[kSubkeyWords];
    std::memcpy(subkeys, key->subKeys, sizeof subkeys);
    const bool chained = cipher->mode == MODE_CBC;
    uint32_t chain[4] = {0, 0, 0, 0};
    if (chained)
        std::memcpy(chain, cipher->iv32, sizeof chain);

    const uint32_t* s = &key->sBox8x32[0][0];
    const int rounds = roundsOf(key);
    if (rounds == kMaxRounds)
        runBlocks<D>(s, subkeys, kMaxRounds, chained, chain, input, inputLen, out);
    else
        runBlocks<D>(s, subkeys, rounds, chained, chain, input, inputLen, out);

    if (chained)
        std::memcpy(cipher->iv32, chain, sizeof chain);
    return inputLen;
}

}  // namespace

extern "C" {

int blockEncrypt(cipherInstance* cipher, keyInstance* key, unsigned char* input, int inputLen,
                 unsigned char* outBuffer)
{
    return process<Direction::kEncrypt>(cipher, key, input, inputLen, outBuffer);
}

int blockDecrypt(cipherInstance* cipher, keyInstance* key, unsigned char* input, int inputLen,
                 unsigned char* outBuffer)
{
    return process<Direction::kDecrypt>(cipher, key, input, inputLen, outBuffer);
}

}  // extern "C"
