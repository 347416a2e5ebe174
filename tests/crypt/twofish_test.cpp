#include <algorithm>
#include <cstring>
#include <numeric>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tessaline/crypt/twofish.h"

namespace {

std::string Hex(const unsigned char* bytes, std::size_t size)
{
    static const char kDigits[] = "0123456789ABCDEF";
    std::string text;
    for (std::size_t i = 0; i < size; ++i)
        text += {kDigits[bytes[i] >> 4], kDigits[bytes[i] & 15]};
    return text;
}

// A key of `bits` bits for `direction`, its words a fixed pattern (or zero).
keyInstance MakeKey(int bits, unsigned char direction, bool zero = false)
{
    keyInstance key{};
    EXPECT_EQ(TRUE, makeKey(&key, direction, bits, nullptr));
    for (int i = 0; i < bits / 32; ++i)
        key.key32[i] = zero ? 0 : 0x01234567u * static_cast<uint32_t>(i + 1) + 0x89ABCDEFu;
    EXPECT_EQ(TRUE, reKey(&key));
    return key;
}

// A cipher in `mode` whose chaining value is 1 in its first block word and
// whose feedback register holds 80 01 02 .. 0F.
cipherInstance MakeCipher(unsigned char mode)
{
    cipherInstance cipher{};
    EXPECT_EQ(TRUE, cipherInit(&cipher, mode, nullptr));
    cipher.iv32[0] = 1;
    std::iota(cipher.IV, cipher.IV + 16, 0);
    cipher.IV[0] = 0x80;
    return cipher;
}

std::vector<unsigned char> Pattern(std::size_t size)
{
    std::vector<unsigned char> bytes(size);
    for (std::size_t i = 0; i < size; ++i)
        bytes[i] = static_cast<unsigned char>(i * 37 + 11);
    return bytes;
}

}  // namespace

// The engine's own byte order gives other cipher text than a standard
// Twofish; these answers pin it for every key size and mode, with keys made
// for either direction. Output bytes the cipher does not own keep their 0xEE.
TEST(TwofishEngine, KnownAnswers)
{
    struct Row {
        const char* label;
        int keyBits;
        bool zero;  // zero key and zero input
        unsigned char mode;
        int inputBits;
        const char* sealed;
    };
    const Row rows[] = {
        {"zero key, zero block", 128, true, MODE_ECB, 128, "A2FB660C9A92BAF34529FD18D99B81AE"},
        {"128-bit key", 128, false, MODE_ECB, 128, "33AF31E1CE17BB5192E134AABFDD0063"},
        {"192-bit key", 192, false, MODE_ECB, 128, "984459472AF8A70D97AAB330CFF9FF10"},
        {"256-bit key", 256, false, MODE_ECB, 128, "66A94968BB6CA2D2629871C5F0903566"},
        {"a last partial block is a whole one", 128, false, MODE_ECB, 8, "33AF31E1CE17BB5192E134AABFDD0063EE"},
        {"no bits, no blocks", 128, false, MODE_ECB, 0, "EE"},
        // The chaining value is a word: the 1 in iv32[0] meets byte 3.
        {"CBC chains blocks", 128, false, MODE_CBC, 384,
         "0D10594592CABD5D0E473B2529E3E5A5188BAFE150FE8076A4D200ADAD28656122C2392B58818BD54F66EA5E7B944D4C"},
        {"CFB1 takes bits from the top", 192, false, MODE_CFB1, 13, "3B8E"},
    };
    for (const Row& row : rows) {
        std::vector<unsigned char> plain = row.zero ? std::vector<unsigned char>(48) : Pattern(48);
        for (unsigned char direction : {DIR_ENCRYPT, DIR_DECRYPT}) {
            SCOPED_TRACE(std::string(row.label) + ", key made for direction " + std::to_string(direction));
            keyInstance key = MakeKey(row.keyBits, direction, row.zero);
            cipherInstance cipher = MakeCipher(row.mode);
            std::vector<unsigned char> sealed(48, 0xEE), opened(48, 0xEE);
            EXPECT_EQ(row.inputBits, blockEncrypt(&cipher, &key, plain.data(), row.inputBits, sealed.data()));
            EXPECT_EQ(row.sealed, Hex(sealed.data(), std::strlen(row.sealed) / 2));
            cipher = MakeCipher(row.mode);
            EXPECT_EQ(row.inputBits, blockDecrypt(&cipher, &key, sealed.data(), row.inputBits, opened.data()));
            EXPECT_EQ(Hex(plain.data(), row.inputBits / 8), Hex(opened.data(), row.inputBits / 8));
        }
    }
    // The exported table, with the matrix output byte z0 in bits 31-24.
    EXPECT_EQ(0x7532BCBCu, MDStab[0][0]);
}

// However the input is split into calls, the cipher text is the same: ECB
// runs several blocks at once, CBC and CFB1 carry their feedback.
TEST(TwofishEngine, CallsMaySplitTheInputAnywhere)
{
    keyInstance key = MakeKey(128, DIR_ENCRYPT);
    std::vector<unsigned char> plain = Pattern(16 * 9);
    for (unsigned char mode : {MODE_ECB, MODE_CBC, MODE_CFB1}) {
        cipherInstance stepwise = MakeCipher(mode);
        std::vector<unsigned char> single(plain.size());
        for (std::size_t at = 0; at < plain.size(); at += 16)
            blockEncrypt(&stepwise, &key, plain.data() + at, 128, single.data() + at);
        for (int blocks = 1; blocks <= 9; ++blocks) {
            cipherInstance whole = MakeCipher(mode), back = MakeCipher(mode);
            std::vector<unsigned char> sealed(16 * blocks), opened(16 * blocks);
            blockEncrypt(&whole, &key, plain.data(), 128 * blocks, sealed.data());
            EXPECT_TRUE(std::equal(sealed.begin(), sealed.end(), single.begin())) << int{mode} << ": " << blocks;
            blockDecrypt(&back, &key, sealed.data(), 128 * blocks, opened.data());
            EXPECT_TRUE(std::equal(opened.begin(), opened.end(), plain.begin())) << int{mode} << ": " << blocks;
        }
    }
}

TEST(TwofishEngine, CodesOfTheClassicInterface)
{
    keyInstance key;
    std::memset(&key, 0x55, sizeof key);
    char text[] = "00112233445566778899AABBCCDDEEFF";
    char empty[] = "";
    EXPECT_EQ(BAD_KEY_MAT, makeKey(&key, DIR_ENCRYPT, 128, text));
    EXPECT_EQ(TRUE, makeKey(&key, DIR_DECRYPT, 256, empty));
    EXPECT_EQ(TRUE, makeKey(&key, DIR_DECRYPT, 100, nullptr));
    EXPECT_EQ(128, key.keyLen);
    EXPECT_EQ(std::vector<uint32_t>(8, 0), std::vector<uint32_t>(key.key32, key.key32 + 8));
    EXPECT_EQ(TRUE, makeKey(&key, DIR_ENCRYPT, 64, nullptr));
    EXPECT_EQ(0, key.numRounds);

    // IV text is refused; ECB ignores it and leaves the feedback state alone.
    cipherInstance cipher;
    std::memset(&cipher, 0x55, sizeof cipher);
    EXPECT_EQ(BAD_IV_MAT, cipherInit(&cipher, MODE_CBC, text));
    EXPECT_EQ(MODE_CBC, cipher.mode);
    EXPECT_EQ(TRUE, cipherInit(&cipher, MODE_ECB, text));
    EXPECT_EQ(0x55555555u, cipher.iv32[0]);

    EXPECT_EQ(BAD_ENDIAN, ParseHexDword(128, text, nullptr, text));

    // Null instances and buffers are refused.
    unsigned char block[16] = {};
    EXPECT_EQ(BAD_KEY_MAT, makeKey(nullptr, DIR_ENCRYPT, 128, nullptr));
    EXPECT_EQ(BAD_KEY_MAT, reKey(nullptr));
    EXPECT_EQ(BAD_IV_MAT, cipherInit(nullptr, MODE_ECB, nullptr));
    key = MakeKey(128, DIR_ENCRYPT);
    EXPECT_EQ(0, blockEncrypt(nullptr, &key, block, 128, block));
    EXPECT_EQ(0, blockDecrypt(&cipher, nullptr, block, 128, block));
    EXPECT_EQ(0, blockEncrypt(&cipher, &key, nullptr, 128, block));
    EXPECT_EQ(0, blockDecrypt(&cipher, &key, block, 128, nullptr));

    // The table query counter answers 0 49 times after a reset, then 1.
    EXPECT_EQ(1, TableOp(2));
    int zeros = 0;
    while (zeros < 100 && TableOp(3) == 0)
        ++zeros;
    EXPECT_EQ(49, zeros);
    EXPECT_EQ(1, TableOp(3));
    EXPECT_EQ(1, TableOp(7));
    EXPECT_EQ(1, TableOp(2));
    EXPECT_EQ(0, TableOp(3));

    unsigned char bytes[256];
    std::iota(bytes, bytes + 256, 0);
    Xor256(bytes, bytes, 0xFF);
    EXPECT_TRUE(bytes[0] == 0xFF && bytes[255] == 0x00);
}
