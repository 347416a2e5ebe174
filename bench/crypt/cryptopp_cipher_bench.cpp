// Crypto++'s standard Twofish as a peer, through its block interface.
#include <cryptopp/twofish.h>

#include "cipher_bench.h"

using namespace cipher_bench;

namespace {

template <typename Direction>
void EcbBench(benchmark::State& state)
{
    Direction cipher(Key256(), 16);
    std::vector<uint8_t> in = Input(kEcbBytes), out(kEcbBytes);
    MeasureThroughput(state, kEcbBytes, [&] {
        cipher.AdvancedProcessBlocks(in.data(), nullptr, out.data(), kEcbBytes, 0);
        benchmark::DoNotOptimize(out.data());
    });
}

void KeySetupBench(benchmark::State& state, std::size_t bytes)
{
    CryptoPP::Twofish::Encryption cipher;
    for (auto _ : state) {
        cipher.SetKey(Key256(), bytes);
        benchmark::DoNotOptimize(&cipher);
    }
}

void TextEncryptBench(benchmark::State& state)
{
    std::vector<uint8_t> value = Input(kTextBytes);
    uint8_t blocks[kTextBytes];
    char text[2 * kTextBytes + 1];
    CryptoPP::Twofish::Encryption cipher;
    for (auto _ : state) {
        cipher.SetKey(Key256(), 16);
        cipher.AdvancedProcessBlocks(value.data(), nullptr, blocks, kTextBytes, 0);
        ToHex(blocks, kTextBytes, text);
        benchmark::DoNotOptimize(text);
    }
}

void TextDecryptBench(benchmark::State& state)
{
    char text[2 * kTextBytes + 1];
    ToHex(Input(kTextBytes).data(), kTextBytes, text);
    uint8_t blocks[kTextBytes], out[kTextBytes];
    CryptoPP::Twofish::Decryption cipher;
    for (auto _ : state) {
        FromHex(text, kTextBytes, blocks);
        cipher.SetKey(Key256(), 16);
        cipher.AdvancedProcessBlocks(blocks, nullptr, out, kTextBytes, 0);
        benchmark::DoNotOptimize(out);
    }
}

[[maybe_unused]] const bool registered = [] {
    bench::Register("crypt_ecb_encrypt", "cryptopp", kEcbSize, EcbBench<CryptoPP::Twofish::Encryption>)
        ->Unit(benchmark::kMillisecond);
    bench::Register("crypt_ecb_decrypt", "cryptopp", kEcbSize, EcbBench<CryptoPP::Twofish::Decryption>)
        ->Unit(benchmark::kMillisecond);
    bench::Register("crypt_key_setup", "cryptopp", "128", KeySetupBench, std::size_t{16});
    bench::Register("crypt_key_setup", "cryptopp", "256", KeySetupBench, std::size_t{32});
    bench::Register("crypt_text_encrypt", "cryptopp", kTextSize, TextEncryptBench);
    bench::Register("crypt_text_decrypt", "cryptopp", kTextSize, TextDecryptBench);
    return true;
}();

}  // namespace
