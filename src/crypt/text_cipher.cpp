// Byte buffers to complemented hexadecimal cipher text and back, for a key
// given as hex digits.
#include "crypt/text_cipher.h"

#include <climits>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>

#include "tessaline/crypt/rvEncrypt.h"

using namespace tessaline::crypt;

namespace {

constexpr std::size_t kBlockBytes = BLOCK_SIZE / 8;
constexpr std::size_t kLengthWordBytes = 4;
constexpr std::size_t kKeyGroupDigits = 8;
constexpr int kMaxKeyGroups = 8;
// The engine counts bits in an int: (length + 4) * 8 must stay below 2^31.
constexpr unsigned long kPayloadLimit = (1UL << 28) - kLengthWordBytes;
constexpr char kFixedKey[] = "3A9F0C52E8B1476D90AD2F63C1E47B58";
constexpr char kHexDigits[] = "0123456789ABCDEF";

// Heap buffer of payload bytes: wiped before it is freed.
class SecretBuffer {
public:
    explicit SecretBuffer(std::size_t size)
        : m_size(size), m_bytes(static_cast<unsigned char*>(std::calloc(size ? size : 1, 1)))
    {
    }
    ~SecretBuffer()
    {
        if (m_bytes != nullptr) {
            explicit_bzero(m_bytes, m_size);
            std::free(m_bytes);
        }
    }
    SecretBuffer(const SecretBuffer&) = delete;
    SecretBuffer& operator=(const SecretBuffer&) = delete;

    unsigned char* Get() const { return m_bytes; }
    explicit operator bool() const { return m_bytes != nullptr; }

private:
    std::size_t m_size;
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

int HexDigitValue(char c)
{
    if (c >= '0' && c <= '9')
        return c - '0';
    if (c >= 'A' && c <= 'F')
        return c - 'A' + 10;
    if (c >= 'a' && c <= 'f')
        return c - 'a' + 10;
    return -1;
}

// A group of eight hex digits, as strtoul in base 16 reads it. Plain digits,
// the usual case, are converted here; anything else (a sign, blanks, a "0x",
// a short or bad group) goes to strtoul itself.
uint32_t KeyGroupValue(const char* group)
{
    uint32_t value = 0;
    for (std::size_t d = 0; d < kKeyGroupDigits; ++d) {
        const int digit = HexDigitValue(group[d]);
        if (digit < 0)
            return static_cast<uint32_t>(std::strtoul(group, nullptr, 16));
        value = value << 4 | static_cast<uint32_t>(digit);
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

unsigned char tessaline::crypt::PairValue(const char* pair)
{
    const int high = HexDigitValue(pair[0]);
    const int low = high < 0 ? -1 : HexDigitValue(pair[1]);
    if (low >= 0)
        return static_cast<unsigned char>(high << 4 | low);
    const char text[3] = {pair[0], pair[1], '\0'};
    return static_cast<unsigned char>(std::strtoul(text, nullptr, 16));
}

int tessaline::crypt::DecryptHexText(char* keyText, const char* text, std::size_t textLength, unsigned char* out,
                                     unsigned long* length)
{
    const int keyBits = KeyBitsOf(keyText);
    if (keyBits == 0)
        return 0;
    const std::size_t blocks = textLength / 2 / kBlockBytes;
    if (blocks > static_cast<std::size_t>(INT_MAX) / BLOCK_SIZE)
        return 0;
    const std::size_t cipherBytes = blocks * kBlockBytes;

    SecretBuffer cipherText(cipherBytes);
    if (!cipherText)
        return 0;
    for (std::size_t i = 0; i < cipherBytes; ++i)
        cipherText.Get()[i] = static_cast<unsigned char>(~PairValue(text + 2 * i));

    CipherContext context;
    if (!TwoFishKeySetup(&context.key, &context.cipher, DIR_DECRYPT, keyText, keyBits))
        return 0;
    // The record buffer is as long as the text, zero past the deciphered
    // blocks; a garbled length word can reach that far and no farther.
    SecretBuffer record(textLength);
    if (!record)
        return 0;
    blockDecrypt(&context.cipher, &context.key, cipherText.Get(), static_cast<int>(blocks * BLOCK_SIZE), record.Get());

    unsigned long stored = 0;
    unsigned long available = 0;
    if (textLength >= kLengthWordBytes) {
        const unsigned char* word = record.Get();
        stored = static_cast<unsigned long>(word[0]) | static_cast<unsigned long>(word[1]) << 8 |
                 static_cast<unsigned long>(word[2]) << 16 | static_cast<unsigned long>(word[3]) << 24;
        available = textLength - kLengthWordBytes;
    }
    if (stored < *length)
        *length = stored;
    if (*length > available)
        *length = available;
    if (*length > 0)
        std::memcpy(out, record.Get() + kLengthWordBytes, *length);
    return 1;
}

int TwoFishEncrypt(char* key, unsigned char* data, unsigned long length, char* out)
{
    if (key == nullptr || data == nullptr || out == nullptr)
        return 0;
    const int keyBits = KeyBitsOf(key);
    if (keyBits == 0 || length >= kPayloadLimit)
        return 0;
    const std::size_t recordBytes = (((length + 3) >> 4) + 1) * kBlockBytes;
    SecretBuffer record(recordBytes);
    if (!record)
        return 0;
    unsigned char* bytes = record.Get();
    for (std::size_t i = 0; i < kLengthWordBytes; ++i)
        bytes[i] = static_cast<unsigned char>(length >> (8 * i));
    std::memcpy(bytes + kLengthWordBytes, data, length);

    CipherContext context;
    if (!TwoFishKeySetup(&context.key, &context.cipher, DIR_ENCRYPT, key, keyBits))
        return 0;
    blockEncrypt(&context.cipher, &context.key, bytes, static_cast<int>((length + kLengthWordBytes) * 8), bytes);

    for (std::size_t i = 0; i < recordBytes; ++i) {
        const unsigned char complemented = static_cast<unsigned char>(~bytes[i]);
        out[2 * i] = kHexDigits[complemented >> 4];
        out[2 * i + 1] = kHexDigits[complemented & 0x0F];
    }
    out[2 * recordBytes] = '\0';
    return 1;
}

int TwoFishDecrypt(char* key, char* text, unsigned char* out, unsigned long* length)
{
    if (key == nullptr || text == nullptr || out == nullptr || length == nullptr)
        return 0;
    return DecryptHexText(key, text, std::strlen(text), out, length);
}
