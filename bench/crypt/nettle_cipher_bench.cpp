// nettle's standard Twofish as a peer.
#include <nettle/twofish.h>

#include "cipher_bench.h"

namespace {

class Nettle {
public:
    void SetKey(std::size_t keyBytes, bool /*encrypt*/) { twofish_set_key(&m_ctx, keyBytes, cipher_bench::Key256()); }
    void Encrypt(const uint8_t* in, uint8_t* out, std::size_t bytes) { twofish_encrypt(&m_ctx, bytes, out, in); }
    void Decrypt(const uint8_t* in, uint8_t* out, std::size_t bytes) { twofish_decrypt(&m_ctx, bytes, out, in); }

private:
    twofish_ctx m_ctx;
};

[[maybe_unused]] const bool registered = cipher_bench::RegisterPeer<Nettle>("nettle");

}  // namespace
