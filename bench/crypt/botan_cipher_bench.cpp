// Botan 2's standard Twofish as a peer.
#include <botan/twofish.h>

#include "cipher_bench.h"

using namespace cipher_bench;

namespace {

void EcbBench(benchmark::State& state, bool encrypt)
{
    Botan::Twofish cipher;
    cipher.set_key(Key256(), 16);
    std::vector<uint8_t> in = Input(kEcbBytes), out(kEcbBytes);
    MeasureThroughput(state, kEcbBytes, [&] {
        if (encrypt)
            cipher.encrypt_n(in.data(), out.data(), kEcbBytes / 16);
        else
            cipher.decrypt_n(in.data(), out.data(), kEcbBytes / 16);
        benchmark::DoNotOptimize(out.data());
    });
}

void KeySetupBench(benchmark::State& state, std::size_t bytes)
{
    Botan::Twofish cipher;
    for (auto _ : state) {
        cipher.set_key(Key256(), bytes);
        benchmark::DoNotOptimize(&cipher);
    }
}

void TextEncryptBench(benchmark::State& state)
{
    std::vector<uint8_t> value = Input(kTextBytes);
    uint8_t blocks[kTextBytes];
    char text[2 * kTextBytes + 1];
    Botan::Twofish cipher;
    for (auto _ : state) {
        cipher.set_key(Key256(), 16);
        cipher.encrypt_n(value.data(), blocks, kTextBytes / 16);
        ToHex(blocks, kTextBytes, text);
        benchmark::DoNotOptimize(text);
    }
}

void TextDecryptBench(benchmark::State& state)
{
    char text[2 * kTextBytes + 1];
    ToHex(Input(kTextBytes).data(), kTextBytes, text);
    uint8_t blocks[kTextBytes], out[kTextBytes];
    Botan::Twofish cipher;
    for (auto _ : state) {
        FromHex(text, kTextBytes, blocks);
        cipher.set_key(Key256(), 16);
        cipher.decrypt_n(blocks, out, kTextBytes / 16);
        benchmark::DoNotOptimize(out);
    }
}

[[maybe_unused]] const bool registered = [] {
    bench::Register("crypt_ecb_encrypt", "botan", kEcbSize, EcbBench, true)->Unit(benchmark::kMillisecond);
    bench::Register("crypt_ecb_decrypt", "botan", kEcbSize, EcbBench, false)->Unit(benchmark::kMillisecond);
    bench::Register("crypt_key_setup", "botan", "128", KeySetupBench, std::size_t{16});
    bench::Register("crypt_key_setup", "botan", "256", KeySetupBench, std::size_t{32});
    bench::Register("crypt_text_encrypt", "botan", kTextSize, TextEncryptBench);
    bench::Register("crypt_text_decrypt", "botan", kTextSize, TextDecryptBench);
    return true;
}();

}  // namespace
