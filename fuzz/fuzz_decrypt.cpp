// rvDecrypt and TwoFishDecrypt on arbitrary text, keys and capacities. The
// output buffer is a heap block exactly as long as the capacity given, so
// that AddressSanitizer stops any write past it; a second call into a larger
// block checks a canary behind the capacity and that both calls agree.
// Round trips through the encrypting side check that what was enciphered
// comes back, cut to the capacity.
#include <fuzzer/FuzzedDataProvider.h>

#include <string.h>

#include <memory>
#include <string>
#include <vector>

#include "fuzz_check.h"
#include "tessaline/crypt/rvEncrypt.h"

namespace {

constexpr unsigned char kCanary = 0xA5;
constexpr size_t kCanaryBytes = 32;
constexpr size_t kMaxCapacity = 1 << 16;

struct Result {
    int status;
    unsigned long length;
    unsigned int wasPlain;
    std::vector<unsigned char> bytes;
};

// memcmp, which must not see a null pointer even for no bytes.
bool SameBytes(const void* a, const void* b, size_t count)
{
    return count == 0 || memcmp(a, b, count) == 0;
}

enum class Decrypter { kText, kTwoFish };

// One call with a buffer of exactly `capacity` bytes (at least one for
// rvDecrypt, which always stores a NUL first), one with a canary behind it.
Result Decrypt(Decrypter which, const std::string& key, const std::string& text, unsigned long capacity)
{
    const size_t room = which == Decrypter::kText && capacity == 0 ? 1 : capacity;
    std::string textCopy = text;
    std::string keyCopy = key;

    std::unique_ptr<unsigned char[]> exact(new unsigned char[room]);
    Result result = {0, capacity, 7, {}};
    if (which == Decrypter::kText)
        result.status = rvDecrypt(textCopy.data(), exact.get(), &result.length, &result.wasPlain);
    else
        result.status = TwoFishDecrypt(keyCopy.data(), textCopy.data(), exact.get(), &result.length);
    FUZZ_CHECK(result.status == 0 || result.status == 1);
    if (result.status == 1)
        FUZZ_CHECK(result.length <= capacity);
    FUZZ_CHECK(textCopy == text && keyCopy == key);

    std::vector<unsigned char> guarded(room + kCanaryBytes, kCanary);
    Result again = {0, capacity, 7, {}};
    if (which == Decrypter::kText)
        again.status = rvDecrypt(textCopy.data(), guarded.data(), &again.length, &again.wasPlain);
    else
        again.status = TwoFishDecrypt(keyCopy.data(), textCopy.data(), guarded.data(), &again.length);
    for (size_t i = room; i < guarded.size(); ++i)
        FUZZ_CHECK(guarded[i] == kCanary);
    FUZZ_CHECK(again.status == result.status && again.length == result.length && again.wasPlain == result.wasPlain);
    if (result.status == 1) {
        // Empty text leaves *length as it was and stores only the NUL.
        const size_t written = which == Decrypter::kText && text.empty() ? 1 : result.length;
        const size_t stored = written < room ? written : room;
        result.bytes.assign(exact.get(), exact.get() + stored);
        FUZZ_CHECK(SameBytes(guarded.data(), exact.get(), stored));
    }
    return result;
}

// Text and key as the library sees them: up to their first NUL.
std::string CString(std::string text)
{
    return std::string(text.c_str());
}

// Arbitrary text, shaped on request like the marked form ("D9", a multiple
// of 32 characters, "AB") or the chained form (80 characters), which random
// bytes would rarely reach.
std::string TakeText(FuzzedDataProvider& input)
{
    std::string text = CString(input.ConsumeRandomLengthString(4096));
    switch (input.ConsumeIntegralInRange(0, 2)) {
    case 0:
        return text;
    case 1:
        text.resize((text.size() / 32 + input.ConsumeIntegralInRange(0, 1)) * 32, '0');
        return "D9" + text + "AB";
    default:
        text.resize(80, 'A');
        return text;
    }
}

void CheckArbitraryText(FuzzedDataProvider& input)
{
    const std::string text = TakeText(input);
    const unsigned long capacity = input.ConsumeIntegralInRange<unsigned long>(0, kMaxCapacity);
    const Result plain = Decrypt(Decrypter::kText, "", text, capacity);
    if (plain.status == 1 && plain.wasPlain == 1 && text.size() != 80 && !text.empty()) {
        // Clear text: copied whole with its NUL, or cut and terminated.
        if (capacity >= text.size() + 1) {
            FUZZ_CHECK(plain.length == text.size());
            FUZZ_CHECK(SameBytes(plain.bytes.data(), text.data(), text.size()));
        } else {
            FUZZ_CHECK(plain.length == capacity);
        }
    }

    std::string key = CString(input.ConsumeRandomLengthString(80));
    if (input.ConsumeBool())
        key.resize(input.ConsumeBool() ? 32 : 64, '0');
    (void)Decrypt(Decrypter::kTwoFish, key, text, capacity);
}

void CheckRoundTrip(FuzzedDataProvider& input)
{
    const bool wide = input.ConsumeBool();
    std::string key = CString(input.ConsumeRandomLengthString(64));
    key.resize(wide ? 64 : 32, 'f');
    const std::string payload = input.ConsumeRandomLengthString(1024);
    const unsigned long capacity = input.ConsumeIntegralInRange<unsigned long>(0, payload.size() + 64);
    const size_t blocks = ((payload.size() + 3) >> 4) + 1;

    std::vector<unsigned char> data(payload.begin(), payload.end());
    data.push_back(0);  // never null, also for an empty payload
    std::string hex(32 * blocks + 1, '\0');
    std::string keyCopy = key;
    FUZZ_CHECK(TwoFishEncrypt(keyCopy.data(), data.data(), payload.size(), hex.data()) == 1);
    hex.resize(32 * blocks);
    const Result direct = Decrypt(Decrypter::kTwoFish, key, hex, capacity);
    FUZZ_CHECK(direct.status == 1);
    const size_t expected = payload.size() < capacity ? payload.size() : capacity;
    FUZZ_CHECK(direct.length == expected && SameBytes(direct.bytes.data(), payload.data(), expected));

    std::string marked(32 * blocks + 5, '\0');
    FUZZ_CHECK(rvEncrypt(data.data(), payload.size(), marked.data()) == 1);
    marked.resize(strlen(marked.c_str()));
    const Result text = Decrypt(Decrypter::kText, "", marked, capacity);
    FUZZ_CHECK(text.status == 1);
    if (payload.empty()) {
        FUZZ_CHECK(text.wasPlain == 1);
    } else {
        FUZZ_CHECK(text.wasPlain == 0);
        FUZZ_CHECK(text.length == expected && SameBytes(text.bytes.data(), payload.data(), expected));
    }
}

// Any capacity is allowed: however large, nothing goes past what the text
// can hold, S + 1 bytes for clear text, 37 for chained text and fewer than
// S for enciphered text.
void CheckHugeCapacity(FuzzedDataProvider& input)
{
    std::string text = TakeText(input);
    std::string key(32, '0');
    const size_t room = text.size() + 1 > 37 ? text.size() + 1 : 37;
    std::unique_ptr<unsigned char[]> out(new unsigned char[room]);
    unsigned long length = ~0UL;
    unsigned int wasPlain = 0;
    FUZZ_CHECK(rvDecrypt(text.data(), out.get(), &length, &wasPlain) == 1);
    length = ~0UL;
    FUZZ_CHECK(TwoFishDecrypt(key.data(), text.data(), out.get(), &length) == 1);
    FUZZ_CHECK(length <= room);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    FuzzedDataProvider input(data, size);
    switch (input.ConsumeIntegralInRange(0, 2)) {
    case 0:
        CheckArbitraryText(input);
        break;
    case 1:
        CheckRoundTrip(input);
        break;
    default:
        CheckHugeCapacity(input);
        break;
    }
    return 0;
}
