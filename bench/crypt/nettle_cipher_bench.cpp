// nettle's standard Twofish as a peer.
#include <nettle/twofish.h>

#include "cipher_bench.h"

using namespace cipher_bench;

namespace {

void BM_Nettle_EcbEncrypt(benchmark::State& state)
{
    twofish_ctx ctx;
    twofish128_set_key(&ctx, Key256());
    std::vector<uint8_t> in = Input(kEcbBytes), out(kEcbBytes);
    MeasureThroughput(state, kEcbBytes, [&] {
        twofish_encrypt(&ctx, kEcbBytes, out.data(), in.data());
        benchmark::DoNotOptimize(out.data());
    });
}
BENCHMARK(BM_Nettle_EcbEncrypt)->Unit(benchmark::kMillisecond);

void BM_Nettle_SetKey(benchmark::State& state)
{
    const std::size_t bytes = static_cast<std::size_t>(state.range(0)) / 8;
    twofish_ctx ctx;
    for (auto _ : state) {
        twofish_set_key(&ctx, bytes, Key256());
        benchmark::DoNotOptimize(&ctx);
    }
}
BENCHMARK(BM_Nettle_SetKey)->Arg(128)->Arg(256);

}  // namespace
