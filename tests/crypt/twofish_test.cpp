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

TEST(TwofishEngine, ZeroKeyGivesThisEnginesCipherText)
{
    keyInstance key = MakeKey(128, DIR_ENCRYPT, true);
    cipherInstance cipher = MakeCipher(MODE_ECB);
    unsigned char block[16] = {};
    unsigned char out[16];
    EXPECT_EQ(128, blockEncrypt(&cipher, &key, block, 128, out));
    EXPECT_EQ("A2FB660C9A92BAF34529FD18D99B81AE", Hex(out, 16));
    EXPECT_EQ(128, blockDecrypt(&cipher, &key, out, 128, out));
    EXPECT_EQ(std::string(32, '0'), Hex(out, 16));
}

TEST(TwofishEngine, DecryptInvertsEncryptForEveryKeySizeAndDirection)
{
    const std::vector<unsigned char> plain = Pattern(64);
    for (int bits : {128, 192, 256}) {
        std::vector<unsigned char> firstSealed;
        for (unsigned char direction : {DIR_ENCRYPT, DIR_DECRYPT}) {
            SCOPED_TRACE(std::to_string(bits) + " bits, direction " + std::to_string(direction));
            keyInstance key = MakeKey(bits, direction);
            EXPECT_EQ(bits, key.keyLen);
            cipherInstance cipher = MakeCipher(MODE_ECB);
            std::vector<unsigned char> sealed(64), opened(64);
            EXPECT_EQ(512, blockEncrypt(&cipher, &key, const_cast<unsigned char*>(plain.data()), 512, sealed.data()));
            EXPECT_NE(plain, sealed);
            // A key made for either direction gives the same cipher text.
            if (firstSealed.empty())
                firstSealed = sealed;
            EXPECT_EQ(firstSealed, sealed);
            EXPECT_EQ(512, blockDecrypt(&cipher, &key, sealed.data(), 512, opened.data()));
            EXPECT_EQ(plain, opened);
        }
    }
}

TEST(TwofishEngine, PartialBlocksAreWholeBlocksAndZeroLengthDoesNothing)
{
    keyInstance key = MakeKey(128, DIR_ENCRYPT);
    cipherInstance cipher = MakeCipher(MODE_ECB);
    std::vector<unsigned char> plain = Pattern(32);
    std::vector<unsigned char> full(32), partial(48, 0xEE);
    blockEncrypt(&cipher, &key, plain.data(), 256, full.data());
    EXPECT_EQ(136, blockEncrypt(&cipher, &key, plain.data(), 136, partial.data()));
    EXPECT_TRUE(std::equal(full.begin(), full.end(), partial.begin()));
    EXPECT_EQ(0xEE, partial[32]);

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
    EXPECT_EQ(BAD_ENDIAN, ParseHexDword(0, nullptr, nullptr, nullptr));
    EXPECT_EQ(7ul, word);

    EXPECT_EQ(1, TableOp(2));
    for (int i = 1; i < 50; ++i)
        EXPECT_EQ(0, TableOp(3)) << "query " << i;
    EXPECT_EQ(1, TableOp(3));
    EXPECT_EQ(1, TableOp(7));
    EXPECT_EQ(1, TableOp(2));
    EXPECT_EQ(0, TableOp(3));
}

TEST(TwofishEngine, ExportedTables)
{
    EXPECT_STREQ("(Full keying)", modeString);
    MakeKey(128, DIR_ENCRYPT);
    EXPECT_EQ(0, needToBuildMDS);
    // Each column of the matrix has one entry 01, in rows 0, 3, 2, 1; that
    // byte of the column's table (row 0 in bits 31-24) is its q permutation.
    const int outerQ[4] = {1, 0, 1, 0};
    const int rowOfOne[4] = {0, 3, 2, 1};
    for (int column = 0; column < 4; ++column)
        for (int x = 0; x < 256; ++x)
            ASSERT_EQ(P8x8[outerQ[column]][x], (MDStab[column][x] >> (24 - 8 * rowOfOne[column])) & 0xFF)
                << column << "/" << x;
    EXPECT_EQ(0x7532BCBCu, MDStab[0][0]);
}

TEST(TwofishEngine, SBoxTablesServeOneInputByteEach)
{
    // With a zero key the key words mixed into h are 0, so each table is the
    // byte's chain of permutations followed by its matrix column.
    keyInstance key = MakeKey(128, DIR_DECRYPT, true);
    const uint32_t* s = &key.sBox8x32[0][0];
    const uint8_t* q0 = P8x8[0];
    const uint8_t* q1 = P8x8[1];
    for (int x = 0; x < 256; ++x) {
        ASSERT_EQ(MDStab[0][q0[q0[x]]], s[2 * x]) << x;
        ASSERT_EQ(MDStab[1][q0[q1[x]]], s[2 * x + 1]) << x;
        ASSERT_EQ(MDStab[2][q1[q0[x]]], s[512 + 2 * x]) << x;
        ASSERT_EQ(MDStab[3][q1[q1[x]]], s[512 + 2 * x + 1]) << x;
    }
    // First subkey pair: A = g(0), B = ROL(g(0x01010101), 8),
    // K0 = A + B, K1 = ROL(A + 2B, 9).
    const uint32_t a = s[0] ^ s[1] ^ s[512] ^ s[513];
    const uint32_t g1 = s[2] ^ s[3] ^ s[514] ^ s[515];
    const uint32_t b = (g1 << 8) | (g1 >> 24);
    EXPECT_EQ(a + b, key.subKeys[0]);
    const uint32_t sum = a + 2 * b;
    EXPECT_EQ((sum << 9) | (sum >> 23), key.subKeys[1]);
}

TEST(TwofishEngine, RoundSubkeysAreStoredLastFirstForEncryption)
{
    keyInstance forward = MakeKey(256, DIR_DECRYPT);
    keyInstance reversed = MakeKey(256, DIR_ENCRYPT);
    EXPECT_EQ(0, std::memcmp(forward.subKeys, reversed.subKeys, 8 * sizeof(uint32_t)));
    for (int pair = 0; pair < 16; ++pair)
        EXPECT_EQ(0, std::memcmp(&forward.subKeys[8 + 2 * pair], &reversed.subKeys[8 + 2 * (15 - pair)], 8));
    ReverseRoundSubkeys(&reversed, DIR_DECRYPT);
    EXPECT_EQ(DIR_DECRYPT, reversed.direction);
    EXPECT_EQ(0, std::memcmp(forward.subKeys, reversed.subKeys, sizeof forward.subKeys));
}

TEST(TwofishEngine, ReedSolomonAndXor256)
{
    // The code is a 32-bit value even where long is 64 bits wide.
    EXPECT_EQ(0ul, RS_MDS_Encode(0, 0));
    const unsigned long code = RS_MDS_Encode(0xFFFFFFFF, 0xFFFFFFFF);
    EXPECT_EQ(code, code & 0xFFFFFFFFul);

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
    EXPECT_EQ((uint32_t(once[32]) << 24) | (once[33] << 16) | (once[34] << 8) | once[35], whole.iv32[0]);

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
