// Number to text in any radix and text to 64-bit number.
#include <algorithm>
#include <cstdint>

#include "tessaline/util/rvString.h"

namespace tessaline::util {
namespace {

constexpr int kMinRadix = 2;
constexpr int kMaxRadix = 36;

// Writes `value` in `radix` (already checked) with an optional minus sign;
// the digits come out last first and are reversed in place.
template <typename Unsigned>
char* WriteDigits(Unsigned value, char* out, int radix, bool negative)
{
    char* p = out;
    if (negative) {
        *p++ = '-';
        value = static_cast<Unsigned>(0 - value);
    }
    char* const digits = p;
    const Unsigned base = static_cast<Unsigned>(radix);
    do {
        const int digit = static_cast<int>(value % base);
        *p++ = static_cast<char>(digit < 10 ? '0' + digit : 'a' + digit - 10);
        value /= base;
    } while (value != 0);
    *p = '\0';
    std::reverse(digits, p);
    return out;
}

// A radix without meaning would divide by zero or never end: such a call
// writes the empty string.
template <typename Unsigned>
char* ToText(Unsigned value, char* out, int radix, bool negative)
{
    if (out == nullptr) {
        return nullptr;
    }
    if (radix < kMinRadix || radix > kMaxRadix) {
        out[0] = '\0';
        return out;
    }
    return WriteDigits(value, out, radix, negative);
}

// Accumulates the decimal digits of `s`, skipping everything else, and
// stops before a digit that makes `Accumulator` smaller. Unsigned arithmetic
// wraps; the signed variant compares after converting back.
template <typename Accumulator>
Accumulator AccumulateDigits(const char* s)
{
    Accumulator value = 0;
    for (; *s != '\0'; ++s) {
        if (*s < '0' || *s > '9') {
            continue;
        }
        const std::uint64_t wide = static_cast<std::uint64_t>(value) * 10 + static_cast<std::uint64_t>(*s - '0');
        const Accumulator next = static_cast<Accumulator>(wide);
        if (next < value) {
            break;
        }
        value = next;
    }
    return value;
}

}  // namespace
}  // namespace tessaline::util

using tessaline::util::AccumulateDigits;
using tessaline::util::ToText;

extern "C" {

char* rv_itoa(int value, char* out, int radix)
{
    return ToText(static_cast<std::uint32_t>(value), out, radix, radix == 10 && value < 0);
}

char* rv_ltoa(long value, char* out, int radix)
{
    return ToText(static_cast<unsigned long>(value), out, radix, radix == 10 && value < 0);
}

char* rv_ultoa(unsigned long value, char* out, int radix)
{
    return ToText(value, out, radix, false);
}

char* _i64toa(long long value, char* out, int radix)
{
    return ToText(static_cast<unsigned long long>(value), out, radix, radix == 10 && value < 0);
}

char* _ui64toa(unsigned long long value, char* out, int radix)
{
    return ToText(value, out, radix, false);
}

long long _atoi64(const char* s)
{
    if (s == nullptr) {
        return 0;
    }
    // Never negative: a step that would cross into the sign bit compares
    // smaller and ends the scan, so the negation cannot overflow.
    const long long value = AccumulateDigits<long long>(s);
    return s[0] == '-' ? -value : value;
}

unsigned long long _atoui64(const char* s)
{
    return s == nullptr ? 0 : AccumulateDigits<unsigned long long>(s);
}

}  // extern "C"
