// The index hash of the name tables and the test of the locale's case
// folding that decides whether the index may be trusted.
#include <atomic>
#include <cctype>
#include <cstdint>
#include <cstring>
#include <ctime>
#include <sys/random.h>
#include <unistd.h>

#include "tessaline/config/NameTable.h"

namespace {

constexpr std::uint64_t kOnes = 0x0101010101010101ull;

std::uint64_t rotate(std::uint64_t x, int bits)
{
    return (x << bits) | (x >> (64 - bits));
}

// A-Z to a-z in all eight bytes at once; other bytes stay.
std::uint64_t foldWord(std::uint64_t word)
{
    const std::uint64_t low = word & (0x7f * kOnes);
    const std::uint64_t atLeastA = low + (0x80 - 'A') * kOnes;
    const std::uint64_t aboveZ = low + (0x80 - 'Z' - 1) * kOnes;
    const std::uint64_t upper = (atLeastA & ~aboveZ & ~word) & (0x80 * kOnes);
    return word | (upper >> 2);
}

struct SipKey {
    std::uint64_t k0;
    std::uint64_t k1;
};

// Drawn once per process. Without the kernel's randomness the key falls back
// to what differs between processes; the hash stays correct either way.
SipKey drawKey()
{
    SipKey key{};
    if (getrandom(&key, sizeof key, GRND_NONBLOCK) != static_cast<ssize_t>(sizeof key)) {
        timespec now{};
        clock_gettime(CLOCK_MONOTONIC, &now);
        key.k0 = static_cast<std::uint64_t>(now.tv_nsec) * 0x9e3779b97f4a7c15ull ^ static_cast<std::uint64_t>(getpid());
        key.k1 = reinterpret_cast<std::uintptr_t>(&key) ^ static_cast<std::uint64_t>(now.tv_sec);
    }
    return key;
}

const SipKey& processKey()
{
    static const SipKey key = drawKey();
    return key;
}

struct SipState {
    std::uint64_t v0, v1, v2, v3;

    void Round()
    {
        v0 += v1;
        v1 = rotate(v1, 13);
        v1 ^= v0;
        v0 = rotate(v0, 32);
        v2 += v3;
        v3 = rotate(v3, 16);
        v3 ^= v2;
        v0 += v3;
        v3 = rotate(v3, 21);
        v3 ^= v0;
        v2 += v1;
        v1 = rotate(v1, 17);
        v1 ^= v2;
        v2 = rotate(v2, 32);
    }

    void Absorb(std::uint64_t word)
    {
        v3 ^= word;
        Round();
        v0 ^= word;
    }
};

bool foldsAsciiOnly(const std::int32_t* table)
{
    for (int c = 0; c < 256; ++c) {
        const int expected = c >= 'A' && c <= 'Z' ? c + 32 : c;
        if (table[c] != expected) {
            return false;
        }
    }
    return true;
}

// The last table found to fold A-Z alone. glibc keeps locale data loaded for
// the life of the process, so a pointer once checked stays what it was.
std::atomic<const std::int32_t*> g_asciiTable{nullptr};

}  // namespace

namespace tessaline::config {

unsigned int FoldedNameHash(const char* text, std::size_t length) noexcept
{
    const SipKey& key = processKey();
    SipState state{key.k0 ^ 0x736f6d6570736575ull, key.k1 ^ 0x646f72616e646f6dull, key.k0 ^ 0x6c7967656e657261ull,
                   key.k1 ^ 0x7465646279746573ull};
    const char* end = text + (length & ~std::size_t{7});
    for (; text != end; text += 8) {
        std::uint64_t word;
        std::memcpy(&word, text, 8);
        state.Absorb(foldWord(word));
    }
    std::uint64_t last = static_cast<std::uint64_t>(length) << 56;
    std::uint64_t tail = 0;
    std::memcpy(&tail, text, length & 7);
    last |= foldWord(tail);
    state.Absorb(last);
    state.v2 ^= 0xff;
    state.Round();
    state.Round();
    state.Round();
    const std::uint64_t h = state.v0 ^ state.v1 ^ state.v2 ^ state.v3;
    return static_cast<unsigned int>(h ^ (h >> 32)) | 0x80000000u;
}

bool AsciiCaseFolding() noexcept
{
    const std::int32_t* table = *__ctype_tolower_loc();
    if (table == g_asciiTable.load(std::memory_order_relaxed)) {
        return true;
    }
    if (!foldsAsciiOnly(table)) {
        return false;
    }
    g_asciiTable.store(table, std::memory_order_relaxed);
    return true;
}

bool AsciiFoldedEqual(const char* a, const char* b) noexcept
{
    for (;; ++a, ++b) {
        const unsigned char x = static_cast<unsigned char>(*a);
        const unsigned char y = static_cast<unsigned char>(*b);
        const int foldedX = x >= 'A' && x <= 'Z' ? x + 32 : x;
        const int foldedY = y >= 'A' && y <= 'Z' ? y + 32 : y;
        if (foldedX != foldedY) {
            return false;
        }
        if (x == 0) {
            return true;
        }
    }
}

std::size_t NextBucketCount(std::size_t wanted) noexcept
{
    static const unsigned long kCounts[] = {
        53ul,        97ul,        193ul,       389ul,       769ul,        1543ul,       3079ul,
        6151ul,      12289ul,     24593ul,     49157ul,     98317ul,      196613ul,     393241ul,
        786433ul,    1572869ul,   3145739ul,   6291469ul,   12582917ul,   25165843ul,   50331653ul,
        100663319ul, 201326611ul, 402653189ul, 805306457ul, 1610612741ul, 3221225473ul, 4294967291ul};
    for (unsigned long count : kCounts) {
        if (count >= wanted) {
            return count;
        }
    }
    return kCounts[sizeof kCounts / sizeof kCounts[0] - 1];
}

}  // namespace tessaline::config
