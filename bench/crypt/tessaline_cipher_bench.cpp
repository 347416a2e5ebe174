// The library's engine and text form. Peers with a standard Twofish run in
// the same executable (nettle_cipher_bench.cpp, botan_cipher_bench.cpp).
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

void BM_Tessaline_EcbEncrypt(benchmark::State& state)
{
    keyInstance key;
    KeyFromBytes(key, 128, DIR_ENCRYPT);
    reKey(&key);
    cipherInstance cipher;
    cipherInit(&cipher, MODE_ECB, nullptr);
    std::vector<uint8_t> in = Input(kEcbBytes), out(kEcbBytes);
    MeasureThroughput(state, kEcbBytes, [&] {
        blockEncrypt(&cipher, &key, in.data(), static_cast<int>(kEcbBytes * 8), out.data());
        benchmark::DoNotOptimize(out.data());
    });
}
BENCHMARK(BM_Tessaline_EcbEncrypt)->Unit(benchmark::kMillisecond);

void BM_Tessaline_EcbDecrypt(benchmark::State& state)
{
    keyInstance key;
    KeyFromBytes(key, 128, DIR_DECRYPT);
    reKey(&key);
    cipherInstance cipher;
    cipherInit(&cipher, MODE_ECB, nullptr);
    std::vector<uint8_t> in = Input(kEcbBytes), out(kEcbBytes);
    MeasureThroughput(state, kEcbBytes, [&] {
        blockDecrypt(&cipher, &key, in.data(), static_cast<int>(kEcbBytes * 8), out.data());
        benchmark::DoNotOptimize(out.data());
    });
}
BENCHMARK(BM_Tessaline_EcbDecrypt)->Unit(benchmark::kMillisecond);

void BM_Tessaline_ReKey(benchmark::State& state)
{
    const int bits = static_cast<int>(state.range(0));
    keyInstance key;
    KeyFromBytes(key, bits, DIR_ENCRYPT);
    for (auto _ : state) {
        reKey(&key);
        benchmark::DoNotOptimize(key.sBox8x32);
    }
}
BENCHMARK(BM_Tessaline_ReKey)->Arg(128)->Arg(256);

void BM_Tessaline_RvEncryptDecrypt64(benchmark::State& state)
{
    std::vector<uint8_t> value = Input(64);
    char text[5 * 32 + 5];
    unsigned char out[64];
    for (auto _ : state) {
        rvEncrypt(value.data(), value.size(), text);
        unsigned long length = sizeof out;
        rvDecrypt(text, out, &length, nullptr);
        benchmark::DoNotOptimize(out);
    }
}
BENCHMARK(BM_Tessaline_RvEncryptDecrypt64);

}  // namespace

BENCHMARK_MAIN();
