// libgcrypt's standard Twofish as a peer: a handle opened once, keyed in the
// timed loop, as a host that keys per message would use it.
#include <gcrypt.h>

#include "cipher_bench.h"

using namespace cipher_bench;

namespace {

// The library wants its version check and an end of initialisation before
// any other call.
void Initialise()
{
    static const bool initialised = [] {
        gcry_check_version(nullptr);
        gcry_control(GCRYCTL_DISABLE_SECMEM, 0);
        gcry_control(GCRYCTL_INITIALIZATION_FINISHED, 0);
        return true;
    }();
    (void)initialised;
}

// One ECB handle for a key size.
class Handle {
public:
    explicit Handle(std::size_t keyBytes)
    {
        Initialise();
        gcry_cipher_open(&m_handle, keyBytes == 16 ? GCRY_CIPHER_TWOFISH128 : GCRY_CIPHER_TWOFISH,
                         GCRY_CIPHER_MODE_ECB, 0);
        SetKey(keyBytes);
    }
    ~Handle() { gcry_cipher_close(m_handle); }
    Handle(const Handle&) = delete;
    Handle& operator=(const Handle&) = delete;

    void SetKey(std::size_t keyBytes) { gcry_cipher_setkey(m_handle, Key256(), keyBytes); }
    void Encrypt(const uint8_t* in, uint8_t* out, std::size_t bytes)
    {
        gcry_cipher_encrypt(m_handle, out, bytes, in, bytes);
    }
    void Decrypt(const uint8_t* in, uint8_t* out, std::size_t bytes)
    {
        gcry_cipher_decrypt(m_handle, out, bytes, in, bytes);
    }

private:
    gcry_cipher_hd_t m_handle = nullptr;
};

void EcbBench(benchmark::State& state, bool encrypt)
{
    Handle cipher(16);
    std::vector<uint8_t> in = Input(kEcbBytes), out(kEcbBytes);
    MeasureThroughput(state, kEcbBytes, [&] {
        if (encrypt)
            cipher.Encrypt(in.data(), out.data(), kEcbBytes);
        else
            cipher.Decrypt(in.data(), out.data(), kEcbBytes);
        benchmark::DoNotOptimize(out.data());
    });
}

void KeySetupBench(benchmark::State& state, std::size_t bytes)
{
    Handle cipher(bytes);
    for (auto _ : state) {
        cipher.SetKey(bytes);
        benchmark::ClobberMemory();
    }
}

void TextEncryptBench(benchmark::State& state)
{
    std::vector<uint8_t> value = Input(kTextBytes);
    uint8_t blocks[kTextBytes];
    char text[2 * kTextBytes + 1];
    Handle cipher(16);
    for (auto _ : state) {
        cipher.SetKey(16);
        cipher.Encrypt(value.data(), blocks, kTextBytes);
        ToHex(blocks, kTextBytes, text);
        benchmark::DoNotOptimize(text);
    }
}

void TextDecryptBench(benchmark::State& state)
{
    char text[2 * kTextBytes + 1];
    ToHex(Input(kTextBytes).data(), kTextBytes, text);
    uint8_t blocks[kTextBytes], out[kTextBytes];
    Handle cipher(16);
    for (auto _ : state) {
        FromHex(text, kTextBytes, blocks);
        cipher.SetKey(16);
        cipher.Decrypt(blocks, out, kTextBytes);
        benchmark::DoNotOptimize(out);
    }
}

[[maybe_unused]] const bool registered = [] {
    bench::Register("crypt_ecb_encrypt", "gcrypt", kEcbSize, EcbBench, true)->Unit(benchmark::kMillisecond);
    bench::Register("crypt_ecb_decrypt", "gcrypt", kEcbSize, EcbBench, false)->Unit(benchmark::kMillisecond);
    bench::Register("crypt_key_setup", "gcrypt", "128", KeySetupBench, std::size_t{16});
    bench::Register("crypt_key_setup", "gcrypt", "256", KeySetupBench, std::size_t{32});
    bench::Register("crypt_text_encrypt", "gcrypt", kTextSize, TextEncryptBench);
    bench::Register("crypt_text_decrypt", "gcrypt", kTextSize, TextDecryptBench);
    return true;
}();

}  // namespace
