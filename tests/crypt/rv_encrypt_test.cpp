#include <cctype>
#include <cstring>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tessaline/crypt/rvEncrypt.h"

namespace {

char kKey128[] = "00112233445566778899AABBCCDDEEFF";
char kKey256[] = "000102030405060708090A0B0C0D0E0F101112131415161718191A1B1C1D1E1F";

std::string Encrypt(std::string payload)
{
    std::string out((payload.size() / 16 + 2) * 32 + 5, '\xEE');
    EXPECT_EQ(1, rvEncrypt(reinterpret_cast<unsigned char*>(&payload[0]), payload.size(), &out[0]));
    return out.c_str();
}

struct Decrypted {
    int result;
    unsigned long length;
    unsigned int wasPlain;
    std::string bytes;  // the first `length` bytes of out
    std::string text;   // out up to its NUL, if it has one within the capacity
};

Decrypted Decrypt(std::string text, unsigned long capacity = 256)
{
    std::vector<char> out(capacity + 1, '\xEE');
    Decrypted d{0, capacity, 7, "", ""};
    d.result = rvDecrypt(&text[0], reinterpret_cast<unsigned char*>(out.data()), &d.length, &d.wasPlain);
    d.bytes.assign(out.data(), d.length <= capacity ? d.length : 0);
    d.text.assign(out.data(), strnlen(out.data(), out.size()));
    return d;
}

std::string Chained(const std::string& head)
{
    return head + std::string(80 - head.size(), '0');
}

}  // namespace

TEST(RvEncrypt, KnownTextAndBlockCounts)
{
    EXPECT_EQ("D9F35E45F0B32BB01E0F8FA0FC5041E80CAB", Encrypt("Hello World!"));
    EXPECT_EQ(36u, Encrypt(std::string(12, 'x')).size());
    EXPECT_EQ(68u, Encrypt(std::string(13, 'x')).size());

    unsigned char hello[] = "Hello World!";
    char text[64];
    EXPECT_EQ(1, rvEncrypt(hello, 0, text));
    EXPECT_STREQ("", text);
    EXPECT_EQ(0, rvEncrypt(nullptr, 1, text));
    EXPECT_EQ(0, rvEncrypt(hello, 1, nullptr));

    // The plain-named forms pass their arguments through.
    EXPECT_EQ(1, RVUI_Encrypt(hello, 12, text));
    EXPECT_STREQ("D9F35E45F0B32BB01E0F8FA0FC5041E80CAB", text);
    unsigned long length = 12;
    EXPECT_EQ(1, RVUI_Decrypt(text, hello, &length, nullptr));
    EXPECT_EQ(12ul, length);
}

TEST(RvDecrypt, EncryptedTextComesBackExactly)
{
    const std::string payload("a\0b\0\0c with NULs", 17);
    const std::string text = Encrypt(payload);
    Decrypted d = Decrypt(text);
    EXPECT_EQ(1, d.result);
    EXPECT_EQ(payload, d.bytes);
    EXPECT_EQ(17ul, d.length);
    EXPECT_EQ(0u, d.wasPlain);

    // Smaller capacity: the first capacity bytes, still a success.
    d = Decrypt(text, 3);
    EXPECT_EQ(1, d.result);
    EXPECT_EQ(std::string("a\0b", 3), d.bytes);

    // Lower-case digits are read too; head and tail are not.
    std::string lower = text;
    for (std::size_t i = 2; i + 2 < lower.size(); ++i)
        lower[i] = static_cast<char>(std::tolower(lower[i]));
    EXPECT_EQ(payload, Decrypt(lower).bytes);
    for (std::size_t position : {0u, 34u, 35u}) {
        std::string marked = Encrypt("Hello World!");
        marked[position] = static_cast<char>(std::tolower(marked[position]));
        d = Decrypt(marked);
        EXPECT_EQ(1u, d.wasPlain) << marked;
        EXPECT_EQ(marked, d.bytes);
    }
}

// Everything but marked text comes back as it is, or from the chained form,
// with *wasPlain set.
TEST(RvDecrypt, ClearChainedAndEmptyText)
{
    struct Case {
        std::string text;
        unsigned long capacity;
        std::string expected;
        unsigned long length;
    };
    const Case cases[] = {
        {"hello", 256, "hello", 5},
        {"hello", 6, "hello", 5},
        {"hello", 3, "he", 3},  // cut short: the length stays the capacity
        {"hello", 1, "", 1},
        {"hello", 0, "", 0},
        {"", 99, "", 99},
        // Marked-looking text without the head, of the wrong length or short.
        {"X900000000000000000000000000000000AB", 256, "X900000000000000000000000000000000AB", 36},
        {"D90000000000000000000000000000000AB", 256, "D90000000000000000000000000000000AB", 35},
        {"D9AB", 256, "D9AB", 4},
        // Any 80 characters are chained text: each byte xor the next one.
        {Chained("26622E100D0900036F"), 37, "hello", 5},
        {std::string(80, 'z'), 256, "", 0},
        // A pair that isn't hex takes strtoul's value: "G1" reads as 0, " F" as 15.
        {Chained("00000000G1"), 256, "", 0},
        {Chained("00000000 F"), 256, "\x0F", 1},
        // 36 characters at most, always terminated.
        {std::string(78, '0') + "41", 64, std::string(36, 'A'), 36},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.text + " into " + std::to_string(c.capacity));
        const Decrypted d = Decrypt(c.text, c.capacity);
        EXPECT_EQ(1, d.result);
        EXPECT_EQ(c.expected, d.text);
        EXPECT_EQ(c.length, d.length);
        EXPECT_EQ(1u, d.wasPlain);
    }
    EXPECT_EQ(0, Decrypt(Chained("26622E100D0900036F"), 36).result) << "chained text needs 37 bytes";
}

TEST(TwoFishText, KnownTextsAndRefusedKeys)
{
    struct Row {
        const char* key;
        std::string payload;
        const char* text;
    };
    const Row rows[] = {
        {kKey256, "0123456789abcdef0123", "2A89B6F0B7BF0E0432125DBDB4E3880EF1A08E7FA2A0F9E699B9CD3878CFB4C9"},
        // The fixed key is the one rvEncrypt uses.
        {"3A9F0C52E8B1476D90AD2F63C1E47B58", "Hello World!", "F35E45F0B32BB01E0F8FA0FC5041E80C"},
    };
    for (Row row : rows) {
        std::string key = row.key;
        std::vector<char> text(80);
        ASSERT_EQ(1, TwoFishEncrypt(&key[0], reinterpret_cast<unsigned char*>(&row.payload[0]), row.payload.size(),
                                    text.data()));
        EXPECT_STREQ(row.text, text.data());
        std::vector<unsigned char> out(64);
        unsigned long length = out.size();
        ASSERT_EQ(1, TwoFishDecrypt(&key[0], text.data(), out.data(), &length));
        EXPECT_EQ(row.payload, std::string(out.begin(), out.begin() + length));
    }

    char key31[] = "00112233445566778899AABBCCDDEEF";
    char key48[] = "00112233445566778899AABBCCDDEEFF0011223344556677";
    unsigned char data[4] = {};
    char text[80] = "";
    for (char* key : {key31, key48}) {
        EXPECT_EQ(0, TwoFishEncrypt(key, data, 4, text));
        unsigned long length = 4;
        EXPECT_EQ(0, TwoFishDecrypt(key, text, data, &length));
    }
}

TEST(TwoFishText, NullsAndMalformedTextAreSafe)
{
    unsigned char data[4] = {1, 2, 3, 4};
    char text[80] = "";
    unsigned char out[64];
    unsigned long length = sizeof out;
    EXPECT_EQ(0, TwoFishEncrypt(nullptr, data, 4, text));
    EXPECT_EQ(0, TwoFishEncrypt(kKey128, nullptr, 4, text));
    EXPECT_EQ(0, TwoFishEncrypt(kKey128, data, 4, nullptr));
    EXPECT_EQ(0, TwoFishDecrypt(nullptr, text, out, &length));
    EXPECT_EQ(0, TwoFishDecrypt(kKey128, nullptr, out, &length));
    EXPECT_EQ(0, TwoFishDecrypt(kKey128, text, nullptr, &length));
    EXPECT_EQ(0, TwoFishDecrypt(kKey128, text, out, nullptr));
    EXPECT_EQ(0, rvDecrypt(nullptr, out, &length, nullptr));
    EXPECT_EQ(0, rvDecrypt(text, nullptr, &length, nullptr));
    EXPECT_EQ(0, rvDecrypt(text, out, nullptr, nullptr));

    // Text shorter than a block, of odd length, or with trailing half
    // blocks: only whole blocks count, nothing is read past the text.
    ASSERT_EQ(1, TwoFishEncrypt(kKey128, data, 4, text));
    const std::string whole = text;
    for (const std::string& shape :
         {std::string(), std::string("A"), whole.substr(0, 31), whole + "F", whole + "0123456789ABCDEF0"}) {
        std::vector<char> copy(shape.begin(), shape.end());
        copy.push_back('\0');
        length = sizeof out;
        EXPECT_EQ(1, TwoFishDecrypt(kKey128, copy.data(), out, &length)) << shape;
        EXPECT_EQ(shape.size() < 32 ? std::string() : std::string(data, data + 4), std::string(out, out + length))
            << shape;
    }

    // Non-hex digits still "succeed", within the buffers.
    const Decrypted d = Decrypt("D9" + std::string(64, 'Q') + "AB", 1000);
    EXPECT_EQ(1, d.result);
    EXPECT_LE(d.length, 60ul);
}

TEST(TwoFishText, LargePayloads)
{
    // Past the records that stay on the stack.
    std::string payload(1000, '\0');
    for (std::size_t i = 0; i < payload.size(); ++i)
        payload[i] = static_cast<char>(i * 7);
    const std::string text = Encrypt(payload);
    EXPECT_EQ(4u + 32u * ((payload.size() + 3) / 16 + 1), text.size());
    EXPECT_TRUE(Decrypt(text, payload.size()).bytes == payload);

    // A length whose bit count would overflow is refused before any read.
    unsigned char data[1] = {0};
    char out[64];
    EXPECT_EQ(0, TwoFishEncrypt(kKey128, data, (1ul << 28) - 4, out));
    EXPECT_EQ(0, rvEncrypt(data, ~0ul, out));
}

// Calls TwoFishHere as the first thing it does; the barrier keeps the call
// from becoming a tail jump.
__attribute__((noinline)) unsigned long CallSite(unsigned long argument)
{
    const unsigned long here = TwoFishHere(argument);
    asm volatile("" ::: "memory");
    return here;
}

TEST(TwoFishHere, ReturnsItsCallSite)
{
    const unsigned long here = CallSite(0);
    EXPECT_EQ(here, CallSite(99)) << "the argument has no effect";
    const unsigned long start = reinterpret_cast<unsigned long>(&CallSite);
    EXPECT_GT(here, start);
    EXPECT_LT(here - start, 256ul) << "the return address lies inside the caller";
}
