// Byte buffers to complemented hexadecimal cipher text and back, for a key
// given as hex digits or for the fixed key.
#include "crypt/text_cipher.h"

#include <array>
#include <climits>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>

#include "crypt/twofish_internal.h"
#include "tessaline/crypt/rvEncrypt.h"

using namespace tessaline::crypt;

namespace {

constexpr std::size_t kBlockBytes = BLOCK_SIZE / 8;
constexpr std::size_t kLengthWordBytes = 4;
constexpr std::size_t kKeyGroupDigits = 8;
constexpr int kMaxKeyGroups = 8;
constexpr std::size_t kFixedKeyBuffer = 33;
// The classic engine counts the bits of a call in an int: (length + 4) * 8
// must stay below 2^31, and so must the bits of a text's whole blocks.
constexpr unsigned long kPayloadLimit = (1UL << 28) - kLengthWordBytes;
constexpr std::size_t kTextBlockLimit = INT_MAX / BLOCK_SIZE;
constexpr char kFixedKey[] = "3A9F0C52E8B1476D90AD2F63C1E47B58";
constexpr char kHexDigits[] = "0123456789ABCDEF";
constexpr unsigned char kNotADigit = 0xFF;

// The value of every character as a hex digit. A table rather than range
// tests: the digits of cipher text are random, and so would be the branches.
constexpr std::array<unsigned char, 256> kDigitValues = [] {
    std::array<unsigned char, 256> values{};
    for (unsigned char& value : values)
        value = kNotADigit;
    for (int c = '0'; c <= '9'; ++c)
        values[c] = static_cast<unsigned char>(c - '0');
    for (int c = 'A'; c <= 'F'; ++c) {
        values[c] = static_cast<unsigned char>(c - 'A' + 10);
        values[c - 'A' + 'a'] = static_cast<unsigned char>(c - 'A' + 10);
    }
    return values;
}();

unsigned DigitValue(char c)
{
    return kDigitValues[static_cast<unsigned char>(c)];
}

// Zeroed payload bytes, wiped before they are given up. The records of
// short values, the usual case, stay on the stack.
class SecretBuffer {
public:
    explicit SecretBuffer(std::size_t size)
        : m_size(size), m_bytes(size <= sizeof m_inline ? m_inline : static_cast<unsigned char*>(std::calloc(size, 1)))
    {
        if (m_bytes == m_inline)
            std::memset(m_inline, 0, size);
    }
    ~SecretBuffer()
    {
        if (m_bytes == nullptr)
            return;
        explicit_bzero(m_bytes, m_size);
        if (m_bytes != m_inline)
            std::free(m_bytes);
    }
    SecretBuffer(const SecretBuffer&) = delete;
    SecretBuffer& operator=(const SecretBuffer&) = delete;

    unsigned char* Get() const { return m_bytes; }
    explicit operator bool() const { return m_bytes != nullptr; }

private:
    std::size_t m_size;
    unsigned char m_inline[512];
    unsigned char* m_bytes;
};

// Key and cipher instances of one call, wiped when the call ends.
struct CipherContext {
    keyInstance key;
    cipherInstance cipher;
    ~CipherContext() { explicit_bzero(this, sizeof *this); }
};

int KeyBitsOf(const char* keyText)
{
    const std::size_t digits = std::strlen(keyText);
    return digits == 32 ? 128 : digits == 64 ? 256 : 0;
}

// A group of eight hex digits, as strtoul in base 16 reads it. Plain digits,
// the usual case, are converted here; anything else (a sign, blanks, a "0x",
// a short or bad group) goes to strtoul itself.
uint32_t KeyGroupValue(const char* group)
{
    uint32_t value = 0;
    for (std::size_t d = 0; d < kKeyGroupDigits; ++d) {
        const unsigned digit = DigitValue(group[d]);
        if (digit > 15)
            return static_cast<uint32_t>(std::strtoul(group, nullptr, 16));
        value = value << 4 | digit;
    }
    return value;
}

}  // namespace

int tessaline::crypt::TwoFishKeySetup(keyInstance* key, cipherInstance* cipher, unsigned char direction, char* keyText,
                                      int keyBits)
{
    if (key == nullptr || cipher == nullptr || keyText == nullptr)
        return 0;
    // reKey below fills the whole S-box tables for these sizes, so clearing
    // them first would be 4 KiB of writes for nothing.
    const bool sBoxesFilled = keyBits == 128 || keyBits == 192 || keyBits == 256;
    std::memset(key, 0, sBoxesFilled ? offsetof(keyInstance, sBox8x32) : sizeof *key);
    std::memset(cipher, 0, sizeof *cipher);
    if (makeKey(key, direction, keyBits, nullptr) != TRUE)
        return 0;
    if (cipherInit(cipher, MODE_ECB, nullptr) != TRUE)
        return 0;
    int groups = keyBits / 32;
    if (groups > kMaxKeyGroups)
        groups = kMaxKeyGroups;
    const char* digits = keyText;
    for (int i = 0; i < groups; ++i) {
        char group[kKeyGroupDigits + 1] = {};
        for (std::size_t d = 0; d < kKeyGroupDigits && *digits != '\0'; ++d)
            group[d] = *digits++;
        key->key32[i] = KeyGroupValue(group);
    }
    reKey(key);
    return 1;
}

void tessaline::crypt::TwoFishFixedKey(char* buffer)
{
    if (buffer != nullptr)
        std::memcpy(buffer, kFixedKey, sizeof kFixedKey);
}

const keyInstance& tessaline::crypt::FixedKeySchedule()
{
    // Every text call would otherwise spend most of its time on this one
    // schedule. The language makes the first initialisation of a local
    // static thread-safe.
    static const keyInstance schedule = [] {
        keyInstance key;
        cipherInstance cipher;
        char text[kFixedKeyBuffer];
        TwoFishFixedKey(text);
        TwoFishKeySetup(&key, &cipher, DIR_DECRYPT, text, 128);
        return key;
    }();
    return schedule;
}

unsigned char tessaline::crypt::PairValue(const char* pair)
{
    const unsigned high = DigitValue(pair[0]);
    const unsigned low = DigitValue(pair[1]);
    // A character that is not a digit sets the high bits.
    if ((high | low) < 16)
        return static_cast<unsigned char>(high << 4 | low);
    const char text[3] = {pair[0], pair[1], '\0'};
    return static_cast<unsigned char>(std::strtoul(text, nullptr, 16));
}

int tessaline::crypt::EncryptToText(const keyInstance& key, const unsigned char* data, unsigned long length, char* out)
{
    if (length >= kPayloadLimit)
        return 0;
    const std::size_t blocks = ((length + 3) >> 4) + 1;
    const std::size_t recordBytes = blocks * kBlockBytes;
    SecretBuffer record(recordBytes);
    if (!record)
        return 0;
    unsigned char* bytes = record.Get();
    for (std::size_t i = 0; i < kLengthWordBytes; ++i)
        bytes[i] = static_cast<unsigned char>(length >> (8 * i));
    std::memcpy(bytes + kLengthWordBytes, data, length);

    CipherBlocks(Direction::kEncrypt, key, bytes, static_cast<long>(blocks), bytes);

    for (std::size_t i = 0; i < recordBytes; ++i) {
        const unsigned char complemented = static_cast<unsigned char>(~bytes[i]);
        out[2 * i] = kHexDigits[complemented >> 4];
        out[2 * i + 1] = kHexDigits[complemented & 0x0F];
    }
    out[2 * recordBytes] = '\0';
    return 1;
}

int tessaline::crypt::DecryptText(const keyInstance& key, const char* text, std::size_t textLength, unsigned char* out,
                                  unsigned long* length)
{
    const std::size_t blocks = textLength / 2 / kBlockBytes;
    if (blocks > kTextBlockLimit)
        return 0;
    const std::size_t cipherBytes = blocks * kBlockBytes;
    // As long as the text, zero past the deciphered blocks: a garbled length
    // word can reach that far and no farther.
    SecretBuffer record(textLength);
    if (!record)
        return 0;
    unsigned char* bytes = record.Get();
    for (std::size_t i = 0; i < cipherBytes; ++i)
        bytes[i] = static_cast<unsigned char>(~PairValue(text + 2 * i));

    CipherBlocks(Direction::kDecrypt, key, bytes, static_cast<long>(blocks), bytes);

    unsigned long stored = 0;
    unsigned long available = 0;
    if (textLength >= kLengthWordBytes) {
        stored = static_cast<unsigned long>(bytes[0]) | static_cast<unsigned long>(bytes[1]) << 8 |
                 static_cast<unsigned long>(bytes[2]) << 16 | static_cast<unsigned long>(bytes[3]) << 24;
        available = textLength - kLengthWordBytes;
    }
    if (stored < *length)
        *length = stored;
    if (*length > available)
        *length = available;
    if (*length > 0)
        std::memcpy(out, bytes + kLengthWordBytes, *length);
    return 1;
}

int TwoFishEncrypt(char* key, unsigned char* data, unsigned long length, char* out)
{
    if (key == nullptr || data == nullptr || out == nullptr)
        return 0;
    const int keyBits = KeyBitsOf(key);
    if (keyBits == 0)
        return 0;
    CipherContext context;
    if (!TwoFishKeySetup(&context.key, &context.cipher, DIR_ENCRYPT, key, keyBits))
        return 0;
    return EncryptToText(context.key, data, length, out);
}

int TwoFishDecrypt(char* key, char* text, unsigned char* out, unsigned long* length)
{
    if (key == nullptr || text == nullptr || out == nullptr || length == nullptr)
        return 0;
    const int keyBits = KeyBitsOf(key);
    if (keyBits == 0)
        return 0;
    CipherContext context;
    if (!TwoFishKeySetup(&context.key, &context.cipher, DIR_DECRYPT, key, keyBits))
        return 0;
    return DecryptText(context.key, text, std::strlen(text), out, length);
}
