// Crypto++'s standard Twofish as a peer, through its block interface. Its
// two directions are separate objects with a key schedule each.
#include <cryptopp/twofish.h>

#include "cipher_bench.h"

namespace {

class CryptoPlusPlus {
public:
    void SetKey(std::size_t keyBytes, bool encrypt)
    {
        if (encrypt)
            m_encryption.SetKey(cipher_bench::Key256(), keyBytes);
        else
            m_decryption.SetKey(cipher_bench::Key256(), keyBytes);
    }
    void Encrypt(const uint8_t* in, uint8_t* out, std::size_t bytes)
    {
        m_encryption.AdvancedProcessBlocks(in, nullptr, out, bytes, 0);
    }
    void Decrypt(const uint8_t* in, uint8_t* out, std::size_t bytes)
    {
        m_decryption.AdvancedProcessBlocks(in, nullptr, out, bytes, 0);
    }

private:
    CryptoPP::Twofish::Encryption m_encryption;
    CryptoPP::Twofish::Decryption m_decryption;
};

[[maybe_unused]] const bool registered = cipher_bench::RegisterPeer<CryptoPlusPlus>("cryptopp");

}  // namespace
