// Botan 2's standard Twofish as a peer.
#include <botan/twofish.h>

#include "cipher_bench.h"

namespace {

class Botan2 {
public:
    void SetKey(std::size_t keyBytes, bool /*encrypt*/) { m_cipher.set_key(cipher_bench::Key256(), keyBytes); }
    void Encrypt(const uint8_t* in, uint8_t* out, std::size_t bytes) { m_cipher.encrypt_n(in, out, bytes / 16); }
    void Decrypt(const uint8_t* in, uint8_t* out, std::size_t bytes) { m_cipher.decrypt_n(in, out, bytes / 16); }

private:
    Botan::Twofish m_cipher;
};

[[maybe_unused]] const bool registered = cipher_bench::RegisterPeer<Botan2>("botan");

}  // namespace
