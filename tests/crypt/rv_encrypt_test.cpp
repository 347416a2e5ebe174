#include <cstring>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tessaline/crypt/rvEncrypt.h"

namespace {

char kKey128[] = "00112233445566778899AABBCCDDEEFF";
const char kKey256[] = "000102030405060708090A0B0C0D0E0F101112131415161718191A1B1C1D1E1F";
// "Hello World!" as rvEncrypt writes it.
const char kHello[] = "D9F35E45F0B32BB01E0F8FA0FC5041E80CAB";
// The bytes 01 02 03 04 under kKey128.
const std::string kFour = "5A087BE8357C2616B42706033C7FB6B0";

struct Decrypted {
    int result;
    unsigned long length;
    unsigned int wasPlain;
    std::string value;  // deciphered: the bytes stored; otherwise the string stored
};

// TwoFishDecrypt with `key`, or rvDecrypt without one, into `capacity` bytes.
Decrypted Decrypt(const char* key, std::string text, unsigned long capacity)
{
    std::string keyText = key == nullptr ? "" : key;
    std::vector<char> out(capacity + 1, '\xEE');
    auto* bytes = reinterpret_cast<unsigned char*>(out.data());
    Decrypted d{0, capacity, key == nullptr ? 7u : 0u, ""};  // TwoFishDecrypt only deciphers
    d.result = key == nullptr ? rvDecrypt(&text[0], bytes, &d.length, &d.wasPlain)
                              : TwoFishDecrypt(&keyText[0], &text[0], bytes, &d.length);
    if (d.wasPlain == 1)
        d.value.assign(out.data(), strnlen(out.data(), out.size()));
    else if (d.length <= capacity)
        d.value.assign(out.data(), d.length);
    return d;
}

std::string Chained(const std::string& head)
{
    return head + std::string(80 - head.size(), '0');
}

}  // namespace

// Known texts, and the payloads they give back.
TEST(TextForms, KnownTextsComeBack)
{
    struct Row {
        const char* label;
        const char* key;  // none: rvEncrypt and rvDecrypt, with the fixed key
        std::string payload;
        std::string text;
    };
    const Row rows[] = {
        {"marked text", nullptr, "Hello World!", kHello},
        {"the fixed key", "3A9F0C52E8B1476D90AD2F63C1E47B58", "Hello World!", "F35E45F0B32BB01E0F8FA0FC5041E80C"},
        {"13 bytes take two blocks", nullptr, std::string(13, 'x'),
         "D9CC869C1C0781AB685B5B5A5F9F356A41FE419243E27C16D754AED9099BAB410AAB"},
        {"NULs are payload", kKey128, std::string("a\0b", 3), "6D6BA553236ABB5A8A411B60CEB9287D"},
        {"256-bit key", kKey256, "0123456789abcdef0123",
         "2A89B6F0B7BF0E0432125DBDB4E3880EF1A08E7FA2A0F9E699B9CD3878CFB4C9"},
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.label);
        std::string payload = row.payload;
        auto* data = reinterpret_cast<unsigned char*>(&payload[0]);
        std::string key = row.key == nullptr ? "" : row.key;
        std::vector<char> text(row.text.size() + 64, '\xEE');
        EXPECT_EQ(1, row.key == nullptr ? rvEncrypt(data, payload.size(), text.data())
                                        : TwoFishEncrypt(&key[0], data, payload.size(), text.data()));
        EXPECT_EQ(row.text, text.data());
        const Decrypted d = Decrypt(row.key, row.text, 64);
        EXPECT_EQ(1, d.result);
        EXPECT_EQ(0u, d.wasPlain);
        EXPECT_EQ(row.payload, d.value);
    }
}

// rvDecrypt reads marked text, 80-character chained text and clear text;
// all but marked text come back as strings, with *wasPlain set. Text that is
// not whole blocks deciphers what blocks it holds.
TEST(TextForms, DecryptingEveryShapeOfText)
{
    struct Row {
        const char* label;
        const char* key;  // none: rvDecrypt
        std::string text;
        unsigned long capacity;
        const char* value;  // none: not compared
        unsigned long length;
        bool deciphered;
    };
    const std::string unmarked = "X9" + std::string(kHello + 2), oneShort = std::string(kHello).erase(2, 1);
    const Row rows[] = {
        {"clear text", nullptr, "hello", 256, "hello", 5, false},
        {"clear text and its NUL just fit", nullptr, "hello", 6, "hello", 5, false},
        {"clear text one short of its NUL is cut", nullptr, "hello", 5, "hell", 5, false},
        {"room for the NUL only", nullptr, "hello", 1, "", 1, false},
        {"capacity 0 counts as 1", nullptr, "hello", 0, "", 0, false},
        {"empty text leaves the length alone", nullptr, "", 99, "", 99, false},
        {"no head", nullptr, unmarked, 256, unmarked.c_str(), 36, false},
        {"not whole blocks", nullptr, oneShort, 256, oneShort.c_str(), 35, false},
        {"no blocks", nullptr, "D9AB", 256, "D9AB", 4, false},
        {"lower-case head", nullptr, "d" + std::string(kHello + 1), 256, nullptr, 36, false},
        {"lower-case tail", nullptr, std::string(kHello, 34) + "aB", 256, nullptr, 36, false},
        {"lower-case tail end", nullptr, std::string(kHello, 35) + "b", 256, nullptr, 36, false},
        {"lower-case digits", nullptr, "D9f35e45f0b32bb01e0f8fa0fc5041e80cAB", 256, "Hello World!", 12, true},
        {"marked text cut to the capacity", nullptr, kHello, 3, "Hel", 3, true},
        // Any 80 characters are chained text: each byte xor the next one.
        {"chained text", nullptr, Chained("26622E100D0900036F"), 37, "hello", 5, false},
        {"chained text of no digits", nullptr, std::string(80, 'z'), 256, "", 0, false},
        // A pair that isn't hex takes strtoul's value: "G1" reads as 0, " F" as 15.
        {"chained G1", nullptr, Chained("00000000G1"), 256, "", 0, false},
        {"chained blank F", nullptr, Chained("00000000 F"), 256, "\x0F", 1, false},
        {"36 at most", nullptr, std::string(78, '0') + "41", 64, "AAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAA", 36, false},
        {"a wrong key: cut to the text", kKey128, "F35E45F0B32BB01E0F8FA0FC5041E80C", 256, nullptr, 28, true},
        {"less than a block", kKey128, kFour.substr(0, 31), 64, "", 0, true},
        {"an odd last digit is dropped", kKey128, kFour + "F", 64, "\x01\x02\x03\x04", 4, true},
        {"half a block more", kKey128, kFour + "0123456789ABCDEF0", 64, "\x01\x02\x03\x04", 4, true},
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.label);
        const Decrypted d = Decrypt(row.key, row.text, row.capacity);
        EXPECT_EQ(1, d.result);
        if (row.value != nullptr) {
            EXPECT_EQ(row.value, d.value);
        }
        EXPECT_EQ(row.length, d.length);
        EXPECT_EQ(row.deciphered ? 0u : 1u, d.wasPlain);
    }
}

TEST(TextForms, RejectedInputs)
{
    unsigned char data[4] = {1, 2, 3, 4};
    char text[80] = "";
    unsigned char out[64];
    unsigned long length = sizeof out;
    char key31[] = "00112233445566778899AABBCCDDEEF";
    char key48[] = "00112233445566778899AABBCCDDEEFF0011223344556677";
    for (char* key : {static_cast<char*>(nullptr), key31, key48}) {
        EXPECT_EQ(0, TwoFishEncrypt(key, data, 4, text));
        EXPECT_EQ(0, TwoFishDecrypt(key, text, out, &length));
    }
    EXPECT_EQ(0, TwoFishEncrypt(kKey128, nullptr, 4, text));
    EXPECT_EQ(0, TwoFishEncrypt(kKey128, data, 4, nullptr));
    EXPECT_EQ(0, TwoFishDecrypt(kKey128, nullptr, out, &length));
    EXPECT_EQ(0, TwoFishDecrypt(kKey128, text, nullptr, &length));
    EXPECT_EQ(0, TwoFishDecrypt(kKey128, text, out, nullptr));
    EXPECT_EQ(0, rvEncrypt(nullptr, 1, text));
    EXPECT_EQ(0, rvEncrypt(data, 1, nullptr));
    EXPECT_EQ(0, rvDecrypt(nullptr, out, &length, nullptr));
    EXPECT_EQ(0, rvDecrypt(text, nullptr, &length, nullptr));
    EXPECT_EQ(0, rvDecrypt(text, out, nullptr, nullptr));
    // A length whose bit count would overflow is refused before any read.
    EXPECT_EQ(0, TwoFishEncrypt(kKey128, data, (1ul << 28) - 4, text));
    EXPECT_EQ(0, rvEncrypt(data, ~0ul, text));
    EXPECT_EQ(0, Decrypt(nullptr, Chained("26622E100D0900036F"), 36).result) << "chained text needs 37 bytes";
    // Nothing to encrypt is the empty text.
    EXPECT_EQ(1, rvEncrypt(data, 0, text));
    EXPECT_STREQ("", text);
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
