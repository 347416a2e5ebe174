#include <algorithm>
#include <cstring>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tessaline/crypt/twofish.h"

namespace {

std::string Hex(const unsigned char* bytes, std::size_t size)
{
    static const char kDigits[] = "0123456789ABCDEF";
    std::string text;
    for (std::size_t i = 0; i < size; ++i) {
        text += kDigits[bytes[i] >> 4];
        text += kDigits[bytes[i] & 15];
    }
    return text;
}

// A key of `bits` bits for `direction`, key32 filled with a fixed pattern
// (or zeros).
keyInstance MakeKey(int bits, unsigned char direction, bool zero = false)
{
    keyInstance key;
    std::memset(&key, 0, sizeof key);
    EXPECT_EQ(TRUE, makeKey(&key, direction, bits, nullptr));
    for (int i = 0; i < bits / 32; ++i)
        key.key32[i] = zero ? 0 : 0x01234567u * static_cast<uint32_t>(i + 1) + 0x89ABCDEFu;
    EXPECT_EQ(TRUE, reKey(&key));
    return key;
}

cipherInstance MakeCipher(unsigned char mode)
{
    cipherInstance cipher;
    std::memset(&cipher, 0, sizeof cipher);
    EXPECT_EQ(TRUE, cipherInit(&cipher, mode, nullptr));
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
// Twofish; these values pin it for each key size and its schedule.
TEST(TwofishEngine, KnownAnswersForEveryKeySizeAndDirection)
{
    struct Row {
        int bits;
        bool zero;
        const char* sealed;
    };
    const Row rows[] = {
        {128, true, "A2FB660C9A92BAF34529FD18D99B81AE"},
        {128, false, "33AF31E1CE17BB5192E134AABFDD0063"},
        {192, false, "984459472AF8A70D97AAB330CFF9FF10"},
        {256, false, "66A94968BB6CA2D2629871C5F0903566"},
    };
    for (const Row& row : rows) {
        std::vector<unsigned char> plain = row.zero ? std::vector<unsigned char>(16) : Pattern(16);
        for (unsigned char direction : {DIR_ENCRYPT, DIR_DECRYPT}) {
            SCOPED_TRACE(std::to_string(row.bits) + " bits, made for direction " + std::to_string(direction));
            keyInstance key = MakeKey(row.bits, direction, row.zero);
            EXPECT_EQ(row.bits, key.keyLen);
            cipherInstance cipher = MakeCipher(MODE_ECB);
            unsigned char sealed[16], opened[16];
            EXPECT_EQ(128, blockEncrypt(&cipher, &key, plain.data(), 128, sealed));
            EXPECT_EQ(row.sealed, Hex(sealed, 16));
            EXPECT_EQ(128, blockDecrypt(&cipher, &key, sealed, 128, opened));
            EXPECT_EQ(Hex(plain.data(), 16), Hex(opened, 16));
        }
    }
    // The exported table, with the matrix output byte z0 in bits 31-24.
    EXPECT_EQ(0x7532BCBCu, MDStab[0][0]);
}

// Blocks go through the cipher several at a time; every count must give
// what the blocks give one by one.
// Blocks go through the cipher several at a time; every count must give
// what the blocks give one by one. A last partial block counts as a whole
// one, and no bits mean no blocks.
TEST(TwofishEngine, ManyBlocksAtOnceEqualOneAtATime)
{
    keyInstance key = MakeKey(128, DIR_ENCRYPT);
    cipherInstance cipher = MakeCipher(MODE_ECB);
    std::vector<unsigned char> plain = Pattern(16 * 9);
    std::vector<unsigned char> single(plain.size());
    for (std::size_t at = 0; at < plain.size(); at += 16)
        blockEncrypt(&cipher, &key, plain.data() + at, 128, single.data() + at);
    for (int blocks = 1; blocks <= 9; ++blocks) {
        std::vector<unsigned char> sealed(plain.size() + 16, 0xEE), opened(plain.size());
        // Even counts end in a block of 8 bits.
        const int bits = blocks % 2 == 0 ? 128 * blocks - 120 : 128 * blocks;
        EXPECT_EQ(bits, blockEncrypt(&cipher, &key, plain.data(), bits, sealed.data()));
        EXPECT_TRUE(std::equal(single.begin(), single.begin() + 16 * blocks, sealed.begin())) << blocks;
        EXPECT_EQ(0xEE, sealed[16 * blocks]) << blocks;
        blockDecrypt(&cipher, &key, sealed.data(), bits, opened.data());
        EXPECT_TRUE(std::equal(plain.begin(), plain.begin() + 16 * blocks, opened.begin())) << blocks;
    }
    std::vector<unsigned char> untouched(16, 0xEE);
    EXPECT_EQ(0, blockEncrypt(&cipher, &key, plain.data(), 0, untouched.data()));
    EXPECT_EQ(0, blockDecrypt(&cipher, &key, plain.data(), 0, untouched.data()));
    EXPECT_EQ(std::vector<unsigned char>(16, 0xEE), untouched);
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
    EXPECT_EQ(16, key.numRounds);
    EXPECT_EQ(DIR_DECRYPT, key.direction);
    EXPECT_EQ('\0', key.keyMaterial[64]);
    EXPECT_EQ(std::vector<uint32_t>(8, 0), std::vector<uint32_t>(key.key32, key.key32 + 8));
    EXPECT_EQ(TRUE, makeKey(&key, DIR_ENCRYPT, 64, nullptr));
    EXPECT_EQ(0, key.numRounds);
    EXPECT_EQ(BAD_KEY_MAT, makeKey(nullptr, DIR_ENCRYPT, 128, nullptr));

    cipherInstance cipher;
    std::memset(&cipher, 0x55, sizeof cipher);
    EXPECT_EQ(BAD_IV_MAT, cipherInit(&cipher, MODE_CBC, text));
    EXPECT_EQ(MODE_CBC, cipher.mode);
    EXPECT_EQ(TRUE, cipherInit(&cipher, MODE_CBC, nullptr));
    EXPECT_EQ(TRUE, cipherInit(&cipher, MODE_ECB, text));
    EXPECT_EQ(0x55555555u, cipher.iv32[0]);
    EXPECT_EQ(0x55, cipher.IV[0]);

    unsigned long word = 7;
    EXPECT_EQ(BAD_ENDIAN, ParseHexDword(128, text, &word, text));
    EXPECT_EQ(7ul, word);

    EXPECT_EQ(1, TableOp(2));
    for (int i = 1; i < 50; ++i)
        EXPECT_EQ(0, TableOp(3)) << "query " << i;
    EXPECT_EQ(1, TableOp(3));
    EXPECT_EQ(1, TableOp(7));
    EXPECT_EQ(1, TableOp(2));
    EXPECT_EQ(0, TableOp(3));

    unsigned char bytes[256];
    for (int i = 0; i < 256; ++i)
        bytes[i] = static_cast<unsigned char>(i);
    Xor256(bytes, bytes, 0xFF);
    for (int i = 0; i < 256; ++i)
        ASSERT_EQ(255 - i, bytes[i]);
}

TEST(TwofishEngine, CbcChainsBlockWordsAcrossCalls)
{
    keyInstance key = MakeKey(128, DIR_ENCRYPT);
    const std::vector<unsigned char> plain = Pattern(48);

    cipherInstance whole = MakeCipher(MODE_CBC);
    std::vector<unsigned char> once(48);
    blockEncrypt(&whole, &key, const_cast<unsigned char*>(plain.data()), 384, once.data());

    cipherInstance stepwise = MakeCipher(MODE_CBC);
    std::vector<unsigned char> inSteps(48);
    for (int i = 0; i < 3; ++i)
        blockEncrypt(&stepwise, &key, const_cast<unsigned char*>(plain.data()) + 16 * i, 128, inSteps.data() + 16 * i);
    EXPECT_EQ(once, inSteps);

    // The chaining value is a word: 1 in iv32[0] is byte 3 of the block.
    cipherInstance chained = MakeCipher(MODE_CBC);
    chained.iv32[0] = 1;
    cipherInstance ecb = MakeCipher(MODE_ECB);
    unsigned char zero[16] = {}, viaIv[16], direct[16];
    unsigned char oneAtByte3[16] = {0, 0, 0, 1};
    blockEncrypt(&chained, &key, zero, 128, viaIv);
    blockEncrypt(&ecb, &key, oneAtByte3, 128, direct);
    EXPECT_EQ(Hex(direct, 16), Hex(viaIv, 16));

    cipherInstance back = MakeCipher(MODE_CBC);
    std::vector<unsigned char> opened(48);
    blockDecrypt(&back, &key, once.data(), 384, opened.data());
    EXPECT_EQ(plain, opened);
}

TEST(TwofishEngine, Cfb1WorksBitByBit)
{
    keyInstance key = MakeKey(192, DIR_DECRYPT);
    const unsigned char iv[16] = {0x80, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15};
    cipherInstance cipher = MakeCipher(MODE_CFB1);
    std::memcpy(cipher.IV, iv, 16);

    // The first bit is the input's top bit xor the top bit of E(IV).
    cipherInstance ecb = MakeCipher(MODE_ECB);
    unsigned char keystream[16];
    blockEncrypt(&ecb, &key, const_cast<unsigned char*>(iv), 128, keystream);

    unsigned char plain[2] = {0xB5, 0x3C};
    unsigned char sealed[2] = {0x00, 0xFF};
    EXPECT_EQ(11, blockEncrypt(&cipher, &key, plain, 11, sealed));
    EXPECT_EQ(MODE_CFB1, cipher.mode);
    EXPECT_EQ((plain[0] ^ keystream[0]) & 0x80, sealed[0] & 0x80);
    EXPECT_EQ(0x1F, sealed[1] & 0x1F) << "bits past the count are left alone";
    // The register has taken in 11 cipher-text bits.
    EXPECT_EQ(static_cast<unsigned char>(iv[1] << 3 | iv[2] >> 5), cipher.IV[0]);

    cipherInstance reader = MakeCipher(MODE_CFB1);
    std::memcpy(reader.IV, iv, 16);
    unsigned char opened[2] = {0, 0};
    EXPECT_EQ(11, blockDecrypt(&reader, &key, sealed, 11, opened));
    EXPECT_EQ(plain[0], opened[0]);
    EXPECT_EQ(plain[1] & 0xE0, opened[1]);
}

TEST(TwofishEngine, NullInstancesAreRefused)
{
    keyInstance key = MakeKey(128, DIR_ENCRYPT);
    cipherInstance cipher = MakeCipher(MODE_ECB);
    unsigned char block[16] = {};
    EXPECT_EQ(0, blockEncrypt(nullptr, &key, block, 128, block));
    EXPECT_EQ(0, blockDecrypt(&cipher, nullptr, block, 128, block));
    EXPECT_EQ(0, blockEncrypt(&cipher, &key, nullptr, 128, block));
    EXPECT_EQ(0, blockDecrypt(&cipher, &key, block, 128, nullptr));
    EXPECT_EQ(BAD_KEY_MAT, reKey(nullptr));
    EXPECT_EQ(BAD_IV_MAT, cipherInit(nullptr, MODE_ECB, nullptr));
}
