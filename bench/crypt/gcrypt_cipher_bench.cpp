// libgcrypt's standard Twofish as a peer: a handle opened once, keyed in the
// timed loop, as a host that keys per message would use it.
#include <gcrypt.h>

#include "cipher_bench.h"

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

// One ECB handle, opened for the key size it is first keyed with.
class Gcrypt {
public:
    Gcrypt() { Initialise(); }
    ~Gcrypt() { gcry_cipher_close(m_handle); }
    Gcrypt(const Gcrypt&) = delete;
    Gcrypt& operator=(const Gcrypt&) = delete;

    void SetKey(std::size_t keyBytes, bool /*encrypt*/)
    {
        if (m_handle == nullptr) {
            gcry_cipher_open(&m_handle, keyBytes == 16 ? GCRY_CIPHER_TWOFISH128 : GCRY_CIPHER_TWOFISH,
                             GCRY_CIPHER_MODE_ECB, 0);
        }
        gcry_cipher_setkey(m_handle, cipher_bench::Key256(), keyBytes);
    }
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

[[maybe_unused]] const bool registered = cipher_bench::RegisterPeer<Gcrypt>("gcrypt");

}  // namespace
