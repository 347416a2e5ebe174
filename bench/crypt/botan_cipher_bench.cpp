// Botan 2's standard Twofish as a peer.
#include <botan/twofish.h>

#include "cipher_bench.h"

using namespace cipher_bench;

namespace {

void BM_Botan_EcbEncrypt(benchmark::State& state)
{
    Botan::Twofish cipher;
    cipher.set_key(Key256(), 16);
    std::vector<uint8_t> in = Input(kEcbBytes), out(kEcbBytes);
    MeasureThroughput(state, kEcbBytes, [&] {
        cipher.encrypt_n(in.data(), out.data(), kEcbBytes / 16);
        benchmark::DoNotOptimize(out.data());
    });
}
BENCHMARK(BM_Botan_EcbEncrypt)->Unit(benchmark::kMillisecond);

void BM_Botan_SetKey(benchmark::State& state)
{
    const std::size_t bytes = static_cast<std::size_t>(state.range(0)) / 8;
    Botan::Twofish cipher;
    for (auto _ : state) {
        cipher.set_key(Key256(), bytes);
        benchmark::DoNotOptimize(&cipher);
    }
}
BENCHMARK(BM_Botan_SetKey)->Arg(128)->Arg(256);

}  // namespace
