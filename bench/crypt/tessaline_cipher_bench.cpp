// The library's engine and text form. Peers with a standard Twofish run in
// the same executable (one file each).
#include <cstring>

#include "cipher_bench.h"
#include "tessaline/crypt/rvEncrypt.h"
#include "tessaline/crypt/twofish.h"

using namespace cipher_bench;

namespace {

void KeyFromBytes(keyInstance& key, int bits, unsigned char direction)
{
    std::memset(&key, 0, sizeof key);
    makeKey(&key, direction, bits, nullptr);
    for (int i = 0; i < bits / 32; ++i)
        std::memcpy(&key.key32[i], Key256() + 4 * i, 4);
}

void EcbBench(benchmark::State& state, unsigned char direction)
{
    keyInstance key;
    KeyFromBytes(key, 128, direction);
    reKey(&key);
    cipherInstance cipher;
    cipherInit(&cipher, MODE_ECB, nullptr);
    std::vector<uint8_t> in = Input(kEcbBytes), out(kEcbBytes);
    const int bits = static_cast<int>(kEcbBytes * 8);
    MeasureThroughput(state, kEcbBytes, [&] {
        if (direction == DIR_ENCRYPT)
            blockEncrypt(&cipher, &key, in.data(), bits, out.data());
        else
            blockDecrypt(&cipher, &key, in.data(), bits, out.data());
        benchmark::DoNotOptimize(out.data());
    });
}

void KeySetupBench(benchmark::State& state, int bits)
{
    keyInstance key;
    KeyFromBytes(key, bits, DIR_ENCRYPT);
    for (auto _ : state) {
        reKey(&key);
        benchmark::DoNotOptimize(key.sBox8x32);
    }
}

void TextEncryptBench(benchmark::State& state)
{
    std::vector<uint8_t> value = Input(kTextBytes);
    char text[5 * 32 + 5];
    for (auto _ : state) {
        rvEncrypt(value.data(), value.size(), text);
        benchmark::DoNotOptimize(text);
    }
}

void TextDecryptBench(benchmark::State& state)
{
    std::vector<uint8_t> value = Input(kTextBytes);
    char text[5 * 32 + 5];
    rvEncrypt(value.data(), value.size(), text);
    unsigned char out[kTextBytes];
    for (auto _ : state) {
        unsigned long length = sizeof out;
        rvDecrypt(text, out, &length, nullptr);
        benchmark::DoNotOptimize(out);
    }
}

[[maybe_unused]] const bool registered = [] {
    bench::Register("crypt_ecb_encrypt", "tessaline", kEcbSize, EcbBench, DIR_ENCRYPT)->Unit(benchmark::kMillisecond);
    bench::Register("crypt_ecb_decrypt", "tessaline", kEcbSize, EcbBench, DIR_DECRYPT)->Unit(benchmark::kMillisecond);
    bench::Register("crypt_key_setup", "tessaline", "128", KeySetupBench, 128);
    bench::Register("crypt_key_setup", "tessaline", "256", KeySetupBench, 256);
    bench::Register("crypt_text_encrypt", "tessaline", kTextSize, TextEncryptBench);
    bench::Register("crypt_text_decrypt", "tessaline", kTextSize, TextDecryptBench);
    return true;
}();

}  // namespace
