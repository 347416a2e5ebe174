// Key set-up of the engine: makeKey, the Reed-Solomon step, the full-keying
// expansion in reKey, and the small companions of the classic interface.
#include <algorithm>
#include <atomic>
#include <climits>
#include <cstring>
#include <initializer_list>

#include "crypt/twofish_internal.h"

// Table and block offsets here are products of small bounded ints (at most
// 4 KiB of tables, whole blocks of a caller's buffer); none can overflow.
// NOLINTBEGIN(bugprone-implicit-widening-of-multiplication-result)

using namespace tessaline::crypt;

namespace {

constexpr uint32_t kRsPolynomial = 0x14D;
constexpr uint32_t kSubkeyStep = 0x02020202;
constexpr uint32_t kSubkeyOdd = 0x01010101;

// The permutation (0 = q0, 1 = q1) that byte j passes before the key word of
// each stage is mixed in; stage 0 uses the first sboxKeys word.
constexpr int kStageQ[4][4] = {
    {0, 0, 1, 1},  // before L0
    {0, 1, 0, 1},  // before L1
    {1, 1, 0, 0},  // before L2 (keys of 192 bits and more)
    {1, 0, 0, 1},  // before L3 (keys of 256 bits)
};

template <int Words>
uint32_t KeyedIndex(int byteIndex, uint32_t x, const uint32_t* keyWords)
{
    for (int stage = Words - 1; stage >= 0; --stage)
        x = P8x8[kStageQ[stage][byteIndex]][x] ^ ByteOf(keyWords[stage], byteIndex);
    return x;
}

// The function h of the cipher, on the key words L0..L(Words-1).
template <int Words>
uint32_t H(uint32_t input, const uint32_t* keyWords)
{
    uint32_t result = 0;
    for (int j = 0; j < 4; ++j)
        result ^= MDStab[j][KeyedIndex<Words>(j, ByteOf(input, j), keyWords)];
    return result;
}

// The subkeys, with h specialised for the number of key words so that its
// stages unroll.
template <int Words>
void FillSubkeys(keyInstance* key, int pairs, const uint32_t* evenWords, const uint32_t* oddWords)
{
    for (int i = 0; i < pairs; ++i) {
        const uint32_t a = H<Words>(i * kSubkeyStep, evenWords);
        const uint32_t b = RotateLeft(H<Words>(i * kSubkeyStep + kSubkeyOdd, oddWords), 8);
        key->subKeys[2 * i] = a + b;
        key->subKeys[2 * i + 1] = RotateLeft(a + 2 * b, 9);
    }
}

template <int Words>
void FillSBoxes(keyInstance* key)
{
    uint32_t* table = &key->sBox8x32[0][0];
    const uint32_t* keyWords = key->sboxKeys;
    for (uint32_t x = 0; x < 256; ++x) {
        table[2 * x] = MDStab[0][KeyedIndex<Words>(0, x, keyWords)];
        table[2 * x + 1] = MDStab[1][KeyedIndex<Words>(1, x, keyWords)];
        table[512 + 2 * x] = MDStab[2][KeyedIndex<Words>(2, x, keyWords)];
        table[512 + 2 * x + 1] = MDStab[3][KeyedIndex<Words>(3, x, keyWords)];
    }
}

// 64-bit pairs of key words, held to what key32 has room for.
int KeyWordPairs(int keyLen)
{
    return (std::clamp(keyLen, 0, 256) + 63) / 64;
}

std::atomic<int> g_tableQueries{0};
constexpr int kTableQueryLimit = 50;

}  // namespace

extern "C" {

int makeKey(keyInstance* key, unsigned char direction, int keyLen, char* keyMaterial)
{
    if (key == nullptr)
        return BAD_KEY_MAT;
    key->direction = direction;
    if (keyLen > 0 && keyLen <= INT_MAX - 63)
        keyLen = (keyLen + 63) & ~63;
    key->keyLen = keyLen;
    int roundIndex = keyLen <= 0 ? 0 : (keyLen - 1) / 64;
    if (roundIndex > 3)
        roundIndex = 3;
    key->numRounds = numRounds[roundIndex];
    std::memset(key->key32, 0, sizeof key->key32);
    key->keyMaterial[MAX_KEY_SIZE] = '\0';
    // Key text would go through ParseHexDword, which refuses all text.
    return keyMaterial == nullptr || keyMaterial[0] == '\0' ? TRUE : BAD_KEY_MAT;
}

int reKey(keyInstance* key)
{
    if (key == nullptr)
        return BAD_KEY_MAT;
    if (__atomic_load_n(&needToBuildMDS, __ATOMIC_ACQUIRE))
        BuildMDS();

    const int pairs = KeyWordPairs(key->keyLen);
    uint32_t evenWords[4] = {0, 0, 0, 0};
    uint32_t oddWords[4] = {0, 0, 0, 0};
    for (int i = 0; i < 4; ++i) {
        evenWords[i] = key->key32[2 * i];
        oddWords[i] = key->key32[2 * i + 1];
    }
    for (int i = 0; i < pairs; ++i)
        key->sboxKeys[pairs - 1 - i] = static_cast<uint32_t>(RS_MDS_Encode(evenWords[i], oddWords[i]));

    const int hWords = pairs < 2 ? 2 : pairs;
    const int subkeyPairs = kWhiteningWords / 2 + RoundsOf(key);
    switch (hWords) {
    case 4:
        FillSubkeys<4>(key, subkeyPairs, evenWords, oddWords);
        break;
    case 3:
        FillSubkeys<3>(key, subkeyPairs, evenWords, oddWords);
        break;
    default:
        FillSubkeys<2>(key, subkeyPairs, evenWords, oddWords);
        break;
    }

    switch (key->keyLen) {
    case 128:
        FillSBoxes<2>(key);
        break;
    case 192:
        FillSBoxes<3>(key);
        break;
    case 256:
        FillSBoxes<4>(key);
        break;
    default:
        break;
    }

    if (key->direction == DIR_ENCRYPT)
        ReverseRoundSubkeys(key, DIR_ENCRYPT);
    return TRUE;
}

int cipherInit(cipherInstance* cipher, unsigned char mode, char* IV)
{
    if (cipher == nullptr)
        return BAD_IV_MAT;
    cipher->mode = mode;
    // IV text would go through ParseHexDword, which refuses all text.
    return mode == MODE_ECB || IV == nullptr ? TRUE : BAD_IV_MAT;
}

int ParseHexDword(int, char*, unsigned long*, char*)
{
    return BAD_ENDIAN;
}

unsigned long RS_MDS_Encode(unsigned long k0, unsigned long k1)
{
    uint32_t remainder = 0;
    for (const uint32_t word : {static_cast<uint32_t>(k1), static_cast<uint32_t>(k0)}) {
        remainder ^= word;
        for (int step = 0; step < 4; ++step) {
            // Shift one byte out through the generator
            // x^4 + (a + 1/a)x^3 + a x^2 + (a + 1/a)x + 1, with a = x mod 0x14D.
            const uint32_t top = remainder >> 24;
            const uint32_t timesA = ((top << 1) ^ ((top & 0x80) ? kRsPolynomial : 0)) & 0xFF;
            const uint32_t timesAPlusInverse = (top >> 1) ^ ((top & 1) ? (kRsPolynomial >> 1) : 0) ^ timesA;
            remainder = (remainder << 8) ^ (timesAPlusInverse << 24) ^ (timesA << 16) ^ (timesAPlusInverse << 8) ^ top;
        }
    }
    return remainder;
}

void ReverseRoundSubkeys(keyInstance* key, unsigned char newDir)
{
    ReverseRoundPairs(key->subKeys);
    key->direction = newDir;
}

void Xor256(unsigned char* dst, unsigned char* src, unsigned char b)
{
    for (int i = 0; i < 256; ++i)
        dst[i] = src[i] ^ b;
}

int TableOp(int op)
{
    if (op == 2) {
        g_tableQueries.store(0, std::memory_order_relaxed);
        return 1;
    }
    if (op != 3)
        return 1;
    // Counts up to the limit and stays there, so it cannot wrap.
    int seen = g_tableQueries.load(std::memory_order_relaxed);
    while (seen < kTableQueryLimit &&
           !g_tableQueries.compare_exchange_weak(seen, seen + 1, std::memory_order_relaxed)) {
    }
    return seen + 1 < kTableQueryLimit ? 0 : 1;
}

}  // extern "C"

void tessaline::crypt::ReverseRoundPairs(uint32_t* subKeys)
{
    uint32_t* first = subKeys + kWhiteningWords;
    uint32_t* last = first + 2 * (kRoundSubkeyPairs - 1);
    for (; first < last; first += 2, last -= 2) {
        const uint32_t even = first[0];
        const uint32_t odd = first[1];
        first[0] = last[0];
        first[1] = last[1];
        last[0] = even;
        last[1] = odd;
    }
}
// NOLINTEND(bugprone-implicit-widening-of-multiplication-result)
