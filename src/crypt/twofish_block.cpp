// Block encryption and decryption of the engine: ECB and CBC over whole
// blocks, and the CFB1 bit loop on top of ECB.
#include <cstring>

#include "crypt/twofish_internal.h"

// Table and block offsets here are products of small bounded ints (at most
// 4 KiB of tables, whole blocks of a caller's buffer); none can overflow.
// NOLINTBEGIN(bugprone-implicit-widening-of-multiplication-result)

using namespace tessaline::crypt;

namespace {

constexpr int kBlockBytes = BLOCK_SIZE / 8;
constexpr int kSubkeyWords = kWhiteningWords + 2 * kRoundSubkeyPairs;

#define TESSALINE_ALWAYS_INLINE inline __attribute__((always_inline))

TESSALINE_ALWAYS_INLINE uint32_t LoadBigEndian(const unsigned char* p)
{
    uint32_t word;
    std::memcpy(&word, p, sizeof word);
    return __builtin_bswap32(word);
}

TESSALINE_ALWAYS_INLINE void StoreBigEndian(unsigned char* p, uint32_t word)
{
    word = __builtin_bswap32(word);
    std::memcpy(p, &word, sizeof word);
}

// The S-box words as pairs: pair x of the first 256 serves bytes 0 and 1 of
// the g input with value x, pair 256 + x bytes 2 and 3. Indexing pairs by a
// byte lets the compiler scale the byte in the address; written as one flat
// index (2x + 1) it folds the doubling into shifts and masks instead, which
// costs over a tenth of the block speed.
using SBoxPairs = const uint32_t (*)[2];

SBoxPairs Pairs(const keyInstance& key)
{
    return reinterpret_cast<SBoxPairs>(&key.sBox8x32[0][0]);
}

TESSALINE_ALWAYS_INLINE uint32_t Byte(uint32_t x, int shift)
{
    return static_cast<uint8_t>(x >> shift);
}

// g of a word, byte j of the input (bits 31-8j downwards) indexing table j.
TESSALINE_ALWAYS_INLINE uint32_t G(SBoxPairs s, uint32_t x)
{
    return s[x >> 24][0] ^ s[Byte(x, 16)][1] ^ s[256 + Byte(x, 8)][0] ^ s[256 + Byte(x, 0)][1];
}

// g of the second round input, whose bytes are taken in the order 3, 0, 1, 2.
TESSALINE_ALWAYS_INLINE uint32_t GRotated(SBoxPairs s, uint32_t x)
{
    return s[Byte(x, 0)][0] ^ s[x >> 24][1] ^ s[256 + Byte(x, 16)][0] ^ s[256 + Byte(x, 8)][1];
}

struct Block {
    uint32_t words[4];
};

// One round pair on `Lanes` independent blocks at once: the table reads of
// one block overlap the dependent chain of another. Both directions take the
// round subkeys from the end of the array: a key turned for encryption holds
// them last first.
template <int Lanes>
TESSALINE_ALWAYS_INLINE void EncryptLanes(SBoxPairs s, const uint32_t* k, int rounds, Block* b)
{
    uint32_t x0[Lanes], x1[Lanes], x2[Lanes], x3[Lanes];
#pragma GCC unroll 4
    for (int l = 0; l < Lanes; ++l) {
        x0[l] = b[l].words[0] ^ k[0];
        x1[l] = b[l].words[1] ^ k[1];
        x2[l] = b[l].words[2] ^ k[2];
        x3[l] = b[l].words[3] ^ k[3];
    }
    const uint32_t* roundKey = k + kSubkeyWords - 2;
#pragma GCC unroll 8
    for (int r = 0; r < rounds; r += 2, roundKey -= 4) {
#pragma GCC unroll 4
        for (int l = 0; l < Lanes; ++l) {
            const uint32_t t0 = G(s, x0[l]);
            const uint32_t t1 = GRotated(s, x1[l]);
            x2[l] = RotateRight(x2[l] ^ (t0 + t1 + roundKey[0]), 1);
            x3[l] = RotateLeft(x3[l], 1) ^ (t0 + 2 * t1 + roundKey[1]);
        }
#pragma GCC unroll 4
        for (int l = 0; l < Lanes; ++l) {
            const uint32_t t0 = G(s, x2[l]);
            const uint32_t t1 = GRotated(s, x3[l]);
            x0[l] = RotateRight(x0[l] ^ (t0 + t1 + roundKey[-2]), 1);
            x1[l] = RotateLeft(x1[l], 1) ^ (t0 + 2 * t1 + roundKey[-1]);
        }
    }
#pragma GCC unroll 4
    for (int l = 0; l < Lanes; ++l) {
        b[l].words[0] = x2[l] ^ k[4];
        b[l].words[1] = x3[l] ^ k[5];
        b[l].words[2] = x0[l] ^ k[6];
        b[l].words[3] = x1[l] ^ k[7];
    }
}

template <int Lanes>
TESSALINE_ALWAYS_INLINE void DecryptLanes(SBoxPairs s, const uint32_t* k, int rounds, Block* b)
{
    uint32_t x0[Lanes], x1[Lanes], x2[Lanes], x3[Lanes];
#pragma GCC unroll 4
    for (int l = 0; l < Lanes; ++l) {
        x0[l] = b[l].words[0] ^ k[4];
        x1[l] = b[l].words[1] ^ k[5];
        x2[l] = b[l].words[2] ^ k[6];
        x3[l] = b[l].words[3] ^ k[7];
    }
    const uint32_t* roundKey = k + kWhiteningWords + 2 * (rounds - 1);
#pragma GCC unroll 8
    for (int r = 0; r < rounds; r += 2, roundKey -= 4) {
#pragma GCC unroll 4
        for (int l = 0; l < Lanes; ++l) {
            const uint32_t t0 = G(s, x0[l]);
            const uint32_t t1 = GRotated(s, x1[l]);
            x2[l] = RotateLeft(x2[l], 1) ^ (t0 + t1 + roundKey[0]);
            x3[l] = RotateRight(x3[l] ^ (t0 + 2 * t1 + roundKey[1]), 1);
        }
#pragma GCC unroll 4
        for (int l = 0; l < Lanes; ++l) {
            const uint32_t t0 = G(s, x2[l]);
            const uint32_t t1 = GRotated(s, x3[l]);
            x0[l] = RotateLeft(x0[l], 1) ^ (t0 + t1 + roundKey[-2]);
            x1[l] = RotateRight(x1[l] ^ (t0 + 2 * t1 + roundKey[-1]), 1);
        }
    }
#pragma GCC unroll 4
    for (int l = 0; l < Lanes; ++l) {
        b[l].words[0] = x2[l] ^ k[0];
        b[l].words[1] = x3[l] ^ k[1];
        b[l].words[2] = x0[l] ^ k[2];
        b[l].words[3] = x1[l] ^ k[3];
    }
}

TESSALINE_ALWAYS_INLINE Block LoadBlock(const unsigned char* p)
{
    return Block{{LoadBigEndian(p), LoadBigEndian(p + 4), LoadBigEndian(p + 8), LoadBigEndian(p + 12)}};
}

TESSALINE_ALWAYS_INLINE void StoreBlock(unsigned char* p, const Block& b)
{
    for (int i = 0; i < 4; ++i)
        StoreBigEndian(p + 4 * i, b.words[i]);
}

template <Direction D, int Lanes>
TESSALINE_ALWAYS_INLINE void CipherLanes(SBoxPairs s, const uint32_t* k, int rounds, Block* b)
{
    if (D == Direction::kEncrypt)
        EncryptLanes<Lanes>(s, k, rounds, b);
    else
        DecryptLanes<Lanes>(s, k, rounds, b);
}

// `Lanes` consecutive blocks in one pass.
template <Direction D, int Lanes>
TESSALINE_ALWAYS_INLINE void RunLanes(SBoxPairs s, const uint32_t* k, int rounds, const unsigned char* in,
                                      unsigned char* out)
{
    Block b[Lanes];
    for (int l = 0; l < Lanes; ++l)
        b[l] = LoadBlock(in + l * kBlockBytes);
    CipherLanes<D, Lanes>(s, k, rounds, b);
    for (int l = 0; l < Lanes; ++l)
        StoreBlock(out + l * kBlockBytes, b[l]);
}

// Electronic code book: blocks are independent, so they go four at a time,
// and the last one to three together.
template <Direction D>
TESSALINE_ALWAYS_INLINE void RunCodeBook(SBoxPairs s, const uint32_t* k, int rounds, long blocks,
                                         const unsigned char* in, unsigned char* out)
{
    constexpr int kLanes = 4;
    // One block left alone would run at the latency of a single chain: the
    // last five go as three and two instead.
    const long tail = blocks % kLanes == 1 && blocks > kLanes ? kLanes + 1 : blocks % kLanes;
    for (; blocks > tail; blocks -= kLanes, in += kLanes * kBlockBytes, out += kLanes * kBlockBytes)
        RunLanes<D, kLanes>(s, k, rounds, in, out);
    if (blocks == kLanes + 1) {
        RunLanes<D, 3>(s, k, rounds, in, out);
        blocks -= 3;
        in += 3 * kBlockBytes;
        out += 3 * kBlockBytes;
    }
    switch (blocks) {
    case 3:
        RunLanes<D, 3>(s, k, rounds, in, out);
        break;
    case 2:
        RunLanes<D, 2>(s, k, rounds, in, out);
        break;
    case 1:
        RunLanes<D, 1>(s, k, rounds, in, out);
        break;
    default:
        break;
    }
}

// Keys of 128 to 256 bits all run 16 rounds: as a constant, the round loop
// unrolls completely.
template <Direction D>
void CodeBook(SBoxPairs s, const uint32_t* k, int rounds, long blocks, const unsigned char* in, unsigned char* out)
{
    if (rounds == kMaxRounds)
        RunCodeBook<D>(s, k, kMaxRounds, blocks, in, out);
    else
        RunCodeBook<D>(s, k, rounds, blocks, in, out);
}

// Cipher block chaining on block words, with the chaining value in `chain`.
template <Direction D>
void RunChained(SBoxPairs s, const uint32_t* k, int rounds, long blocks, uint32_t* chain, const unsigned char* in,
                unsigned char* out)
{
    for (; blocks > 0; --blocks, in += kBlockBytes, out += kBlockBytes) {
        Block b = LoadBlock(in);
        if (D == Direction::kEncrypt) {
            for (int i = 0; i < 4; ++i)
                b.words[i] ^= chain[i];
            EncryptLanes<1>(s, k, rounds, &b);
            std::memcpy(chain, b.words, sizeof b.words);
        } else {
            const Block cipherWords = b;
            DecryptLanes<1>(s, k, rounds, &b);
            for (int i = 0; i < 4; ++i)
                b.words[i] ^= chain[i];
            std::memcpy(chain, cipherWords.words, sizeof cipherWords.words);
        }
        StoreBlock(out, b);
    }
}

// The one-bit feedback loop: each bit is combined with the top bit of the
// enciphered feedback register, which then shifts left taking in the
// cipher-text bit.
int RunCfb1(cipherInstance* cipher, keyInstance* key, const unsigned char* input, int inputLen, unsigned char* out,
            Direction direction)
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
int Process(cipherInstance* cipher, keyInstance* key, const unsigned char* input, int inputLen, unsigned char* out)
{
    if (cipher == nullptr || key == nullptr || (inputLen > 0 && (input == nullptr || out == nullptr)))
        return 0;
    if (cipher->mode == MODE_CFB1)
        return RunCfb1(cipher, key, input, inputLen, out, D);

    const unsigned char direction = D == Direction::kEncrypt ? DIR_ENCRYPT : DIR_DECRYPT;
    if (key->direction != direction)
        ReverseRoundSubkeys(key, direction);

    if (inputLen <= 0)
        return inputLen;
    // A last partial block counts as a whole one.
    const long blocks = (inputLen - 1L) / BLOCK_SIZE + 1;
    if (cipher->mode != MODE_CBC) {
        CipherBlocks(D, *key, input, blocks, out);
        return inputLen;
    }
    uint32_t subkeys[kSubkeyWords];
    std::memcpy(subkeys, key->subKeys, sizeof subkeys);
    uint32_t chain[4];
    std::memcpy(chain, cipher->iv32, sizeof chain);
    RunChained<D>(Pairs(*key), subkeys, RoundsOf(key), blocks, chain, input, out);
    std::memcpy(cipher->iv32, chain, sizeof chain);
    return inputLen;
}

}  // namespace

extern "C" {

int blockEncrypt(cipherInstance* cipher, keyInstance* key, unsigned char* input, int inputLen, unsigned char* outBuffer)
{
    return Process<Direction::kEncrypt>(cipher, key, input, inputLen, outBuffer);
}

int blockDecrypt(cipherInstance* cipher, keyInstance* key, unsigned char* input, int inputLen, unsigned char* outBuffer)
{
    return Process<Direction::kDecrypt>(cipher, key, input, inputLen, outBuffer);
}

}  // extern "C"

void tessaline::crypt::CipherBlocks(Direction direction, const keyInstance& key, const unsigned char* in, long blocks,
                                    unsigned char* out)
{
    // The local copy also keeps the block loop free of indirection through
    // the key.
    uint32_t subkeys[kSubkeyWords];
    std::memcpy(subkeys, key.subKeys, sizeof subkeys);
    if (key.direction != (direction == Direction::kEncrypt ? DIR_ENCRYPT : DIR_DECRYPT))
        ReverseRoundPairs(subkeys);
    if (direction == Direction::kEncrypt)
        CodeBook<Direction::kEncrypt>(Pairs(key), subkeys, RoundsOf(&key), blocks, in, out);
    else
        CodeBook<Direction::kDecrypt>(Pairs(key), subkeys, RoundsOf(&key), blocks, in, out);
}
// NOLINTEND(bugprone-implicit-widening-of-multiplication-result)
