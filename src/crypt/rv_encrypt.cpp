// The marked text form under the library's fixed key, and its plain-named
// exports.
#include <cstring>

#include "crypt/text_cipher.h"
#include "tessaline/crypt/rvEncrypt.h"

using namespace tessaline::crypt;

namespace {

constexpr std::size_t kMarkBytes = 2;
constexpr std::size_t kHexPerBlock = 32;
constexpr std::size_t kChainedText = 80;
constexpr std::size_t kChainedBytes = kChainedText / 2;
constexpr std::size_t kChainedPrefix = 4;
constexpr std::size_t kChainedString = 36;

bool IsMarked(const char* text, std::size_t size)
{
    return size > 2 * kMarkBytes && (size - 2 * kMarkBytes) % kHexPerBlock == 0 && text[0] == 'D' && text[1] == '9' &&
           text[size - 2] == 'A' && text[size - 1] == 'B';
}

// Each byte of the chained form is stored xor the byte after it.
int ReadChained(const char* text, unsigned char* out, unsigned long* length)
{
    if (*length < kChainedString + 1)
        return 0;
    unsigned char bytes[kChainedBytes];
    for (std::size_t i = 0; i < kChainedBytes; ++i)
        bytes[i] = PairValue(text + 2 * i);
    for (std::size_t i = kChainedBytes - 1; i-- > 0;)
        bytes[i] ^= bytes[i + 1];
    char* string = reinterpret_cast<char*>(out);
    std::strncpy(string, reinterpret_cast<const char*>(bytes + kChainedPrefix), kChainedString);
    string[kChainedString] = '\0';
    *length = std::strlen(string);
    return 1;
}

void CopyClearText(const char* text, std::size_t size, unsigned char* out, unsigned long* length)
{
    if (*length >= size + 1) {
        std::memcpy(out, text, size + 1);
        *length = size;
    } else if (*length > 1) {
        std::memcpy(out, text, *length - 1);
        out[*length - 1] = '\0';
    }
}

}  // namespace

int rvEncrypt(unsigned char* data, unsigned long length, char* out)
{
    if (data == nullptr || out == nullptr)
        return 0;
    if (length == 0) {
        out[0] = '\0';
        return 1;
    }
    if (!EncryptToText(FixedKeySchedule(), data, length, out + kMarkBytes))
        return 0;
    out[0] = 'D';
    out[1] = '9';
    std::strcat(out, "AB");
    return 1;
}

int rvDecrypt(char* text, unsigned char* out, unsigned long* length, unsigned int* wasPlain)
{
    if (text == nullptr || out == nullptr || length == nullptr)
        return 0;
    if (wasPlain != nullptr)
        *wasPlain = 0;
    out[0] = '\0';
    const std::size_t size = std::strlen(text);
    if (IsMarked(text, size)) {
        return DecryptText(FixedKeySchedule(), text + kMarkBytes, size - 2 * kMarkBytes, out, length);
    }
    if (size == kChainedText) {
        if (!ReadChained(text, out, length))
            return 0;
    } else if (size != 0) {
        CopyClearText(text, size, out, length);
    }
    if (wasPlain != nullptr)
        *wasPlain = 1;
    return 1;
}

#if defined(__clang__)
__attribute__((noinline))
#else
__attribute__((noipa))
#endif
unsigned long
TwoFishHere(unsigned long)
{
    return reinterpret_cast<unsigned long>(__builtin_return_address(0));
}

extern "C" {

int RVUI_Encrypt(unsigned char* data, unsigned long length, char* out)
{
    return rvEncrypt(data, length, out);
}

int RVUI_Decrypt(char* text, unsigned char* out, unsigned long* length, unsigned int* wasPlain)
{
    return rvDecrypt(text, out, length, wasPlain);
}

}  // extern "C"
