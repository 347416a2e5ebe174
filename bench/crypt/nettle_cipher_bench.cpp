// nettle's standard Twofish as a peer.
#include <nettle/twofish.h>

#include "cipher_bench.h"

using namespace cipher_bench;

namespace {

void EcbBench(benchmark::State& state, bool encrypt)
{
    twofish_ctx ctx;
    twofish128_set_key(&ctx, Key256());
    std::vector<uint8_t> in = Input(kEcbBytes), out(kEcbBytes);
    MeasureThroughput(state, kEcbBytes, [&] {
        if (encrypt)
            twofish_encrypt(&ctx, kEcbBytes, out.data(), in.data());
        else
            twofish_decrypt(&ctx, kEcbBytes, out.data(), in.data());
        benchmark::DoNotOptimize(out.data());
    });
}

void KeySetupBench(benchmark::State& state, std::size_t bytes)
{
    twofish_ctx ctx;
    for (auto _ : state) {
        twofish_set_key(&ctx, bytes, Key256());
        benchmark::DoNotOptimize(&ctx);
    }
}

void TextEncryptBench(benchmark::State& state)
{
    std::vector<uint8_t> value = Input(kTextBytes);
    uint8_t blocks[kTextBytes];
    char text[2 * kTextBytes + 1];
    twofish_ctx ctx;
    for (auto _ : state) {
        twofish128_set_key(&ctx, Key256());
        twofish_encrypt(&ctx, kTextBytes, blocks, value.data());
        ToHex(blocks, kTextBytes, text);
        benchmark::DoNotOptimize(text);
    }
}

void TextDecryptBench(benchmark::State& state)
{
    char text[2 * kTextBytes + 1];
    ToHex(Input(kTextBytes).data(), kTextBytes, text);
    uint8_t blocks[kTextBytes], out[kTextBytes];
    twofish_ctx ctx;
    for (auto _ : state) {
        FromHex(text, kTextBytes, blocks);
        twofish128_set_key(&ctx, Key256());
        twofish_decrypt(&ctx, kTextBytes, out, blocks);
        benchmark::DoNotOptimize(out);
    }
}

[[maybe_unused]] const bool registered = [] {
    bench::Register("crypt_ecb_encrypt", "nettle", kEcbSize, EcbBench, true)->Unit(benchmark::kMillisecond);
    bench::Register("crypt_ecb_decrypt", "nettle", kEcbSize, EcbBench, false)->Unit(benchmark::kMillisecond);
    bench::Register("crypt_key_setup", "nettle", "128", KeySetupBench, std::size_t{16});
    bench::Register("crypt_key_setup", "nettle", "256", KeySetupBench, std::size_t{32});
    bench::Register("crypt_text_encrypt", "nettle", kTextSize, TextEncryptBench);
    bench::Register("crypt_text_decrypt", "nettle", kTextSize, TextDecryptBench);
    return true;
}();

}  // namespace
