// Shared set-up of the cipher benchmarks: the same key, the same 16 MiB of
// input, the same hexadecimal text step, and a cycles-per-byte counter: the
// thread's CPU time in cycles of the time-stamp counter (the nominal clock),
// so that time lost to other processes on a busy machine does not count.
//
// Groups (see common/bench_names.h):
//   crypt_ecb_encrypt/<impl>/16MiB, crypt_ecb_decrypt/<impl>/16MiB
//   crypt_key_setup/<impl>/128, crypt_key_setup/<impl>/256
//   crypt_text_encrypt/<impl>/64B: Tessaline's rvEncrypt of 64 bytes (five
//     blocks and the hex text; the fixed key's schedule is made once per
//     process); for a peer its key setup, four blocks and the same hex step,
//     as a host that keys per message.
//   crypt_text_decrypt/<impl>/64B: the way back.
#ifndef TESSALINE_BENCH_CRYPT_CIPHER_BENCH_H
#define TESSALINE_BENCH_CRYPT_CIPHER_BENCH_H

#include <chrono>
#include <cstdint>
#include <ctime>
#include <vector>

#include <benchmark/benchmark.h>
#include <x86intrin.h>

#include "common/bench_names.h"

namespace cipher_bench {

constexpr std::size_t kEcbBytes = 16u << 20;
constexpr std::size_t kTextBytes = 64;
constexpr const char* kEcbSize = "16MiB";
constexpr const char* kTextSize = "64B";

inline const uint8_t* Key256()
{
    static const uint8_t key[32] = {0x3A, 0x9F, 0x0C, 0x52, 0xE8, 0xB1, 0x47, 0x6D, 0x90, 0xAD, 0x2F,
                                    0x63, 0xC1, 0xE4, 0x7B, 0x58, 0x01, 0x23, 0x45, 0x67, 0x89, 0xAB,
                                    0xCD, 0xEF, 0xFE, 0xDC, 0xBA, 0x98, 0x76, 0x54, 0x32, 0x10};
    return key;
}

inline std::vector<uint8_t> Input(std::size_t size)
{
    std::vector<uint8_t> bytes(size);
    for (std::size_t i = 0; i < size; ++i)
        bytes[i] = static_cast<uint8_t>(i * 131 + 7);
    return bytes;
}

// The text step of the peers: complemented bytes as upper-case hex digits,
// as the library writes them.
inline void ToHex(const uint8_t* bytes, std::size_t count, char* out)
{
    static const char digits[] = "0123456789ABCDEF";
    for (std::size_t i = 0; i < count; ++i) {
        const uint8_t complemented = static_cast<uint8_t>(~bytes[i]);
        out[2 * i] = digits[complemented >> 4];
        out[2 * i + 1] = digits[complemented & 0x0F];
    }
    out[2 * count] = '\0';
}

inline int HexValue(char c)
{
    return c <= '9' ? c - '0' : (c & ~0x20) - 'A' + 10;
}

inline void FromHex(const char* text, std::size_t count, uint8_t* bytes)
{
    for (std::size_t i = 0; i < count; ++i)
        bytes[i] = static_cast<uint8_t>(~(HexValue(text[2 * i]) << 4 | HexValue(text[2 * i + 1])));
}

// Ticks of the time-stamp counter per second, measured once.
inline double TscHz()
{
    static const double hz = [] {
        const auto start = std::chrono::steady_clock::now();
        const uint64_t ticks = __rdtsc();
        while (std::chrono::steady_clock::now() - start < std::chrono::milliseconds(100)) {
        }
        const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - start;
        return static_cast<double>(__rdtsc() - ticks) / elapsed.count();
    }();
    return hz;
}

inline double ThreadCpuSeconds()
{
    timespec now;
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return static_cast<double>(now.tv_sec) + now.tv_nsec * 1e-9;
}

// Runs `body` once per iteration and reports bytes/s and cycles/byte.
template <typename Body>
void MeasureThroughput(benchmark::State& state, std::size_t bytesPerIteration, Body body)
{
    const double hz = TscHz();
    double cpuSeconds = 0;
    for (auto _ : state) {
        const double start = ThreadCpuSeconds();
        body();
        cpuSeconds += ThreadCpuSeconds() - start;
    }
    const double bytes = static_cast<double>(bytesPerIteration) * state.iterations();
    state.SetBytesProcessed(static_cast<int64_t>(bytes));
    state.counters["cycles/byte"] = cpuSeconds * hz / bytes;
}

namespace peer {

// The groups of a standard-Twofish peer, given as a class that is built
// unkeyed and has
//   void SetKey(std::size_t keyBytes, bool encrypt);  // Key256()'s first bytes
//   void Encrypt(const uint8_t* in, uint8_t* out, std::size_t bytes);
//   void Decrypt(const uint8_t* in, uint8_t* out, std::size_t bytes);
// A peer with one schedule for both directions ignores `encrypt`.
template <typename Peer>
void EcbBench(benchmark::State& state, bool encrypt)
{
    Peer cipher;
    cipher.SetKey(16, encrypt);
    std::vector<uint8_t> in = Input(kEcbBytes), out(kEcbBytes);
    MeasureThroughput(state, kEcbBytes, [&] {
        if (encrypt)
            cipher.Encrypt(in.data(), out.data(), kEcbBytes);
        else
            cipher.Decrypt(in.data(), out.data(), kEcbBytes);
        benchmark::DoNotOptimize(out.data());
    });
}

template <typename Peer>
void KeySetupBench(benchmark::State& state, std::size_t bytes)
{
    Peer cipher;
    for (auto _ : state) {
        cipher.SetKey(bytes, true);
        benchmark::DoNotOptimize(&cipher);
        benchmark::ClobberMemory();
    }
}

// Key setup, four blocks and the hex step, as a host that keys per message.
template <typename Peer>
void TextEncryptBench(benchmark::State& state)
{
    std::vector<uint8_t> value = Input(kTextBytes);
    uint8_t blocks[kTextBytes];
    char text[2 * kTextBytes + 1];
    Peer cipher;
    for (auto _ : state) {
        cipher.SetKey(16, true);
        cipher.Encrypt(value.data(), blocks, kTextBytes);
        ToHex(blocks, kTextBytes, text);
        benchmark::DoNotOptimize(text);
    }
}

template <typename Peer>
void TextDecryptBench(benchmark::State& state)
{
    char text[2 * kTextBytes + 1];
    ToHex(Input(kTextBytes).data(), kTextBytes, text);
    uint8_t blocks[kTextBytes], out[kTextBytes];
    Peer cipher;
    for (auto _ : state) {
        FromHex(text, kTextBytes, blocks);
        cipher.SetKey(16, false);
        cipher.Decrypt(blocks, out, kTextBytes);
        benchmark::DoNotOptimize(out);
    }
}

}  // namespace peer

// Registers the groups of `Peer` (see peer::EcbBench) under `impl`.
template <typename Peer>
bool RegisterPeer(const char* impl)
{
    bench::Register("crypt_ecb_encrypt", impl, kEcbSize, peer::EcbBench<Peer>, true)->Unit(benchmark::kMillisecond);
    bench::Register("crypt_ecb_decrypt", impl, kEcbSize, peer::EcbBench<Peer>, false)->Unit(benchmark::kMillisecond);
    bench::Register("crypt_key_setup", impl, "128", peer::KeySetupBench<Peer>, std::size_t{16});
    bench::Register("crypt_key_setup", impl, "256", peer::KeySetupBench<Peer>, std::size_t{32});
    bench::Register("crypt_text_encrypt", impl, kTextSize, peer::TextEncryptBench<Peer>);
    bench::Register("crypt_text_decrypt", impl, kTextSize, peer::TextDecryptBench<Peer>);
    return true;
}

}  // namespace cipher_bench

#endif
