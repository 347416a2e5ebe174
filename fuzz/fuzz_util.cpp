// The text, number and time helpers on arbitrary input, each checked against
// a small model of its contract: HashToken on sorted and unsorted tables,
// _atoi64 and _atoui64, the radix conversions with any radix, rvTime::Format
// and rvTimeSpan::Format with any format, and the case-insensitive searches
// and the bounded copy. Output buffers are heap blocks of exactly the room
// the contract asks for, so AddressSanitizer stops a write past it.
#include <fuzzer/FuzzedDataProvider.h>

#include <stdlib.h>
#include <string.h>
#include <strings.h>

#include <algorithm>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "fuzz_check.h"
#include "tessaline/util/HashToken.h"
#include "tessaline/util/rvString.h"
#include "tessaline/util/rvTime.h"

namespace {

// Room for 64 binary digits, a minus sign and the NUL.
constexpr size_t kNumberRoom = 66;

std::string TakeCString(FuzzedDataProvider& input, size_t maxLength)
{
    std::string text = input.ConsumeRandomLengthString(maxLength);
    return std::string(text.c_str());
}

bool IsPrefix(const std::string& name, const std::string& token)
{
    return strncasecmp(name.c_str(), token.c_str(), name.size()) == 0;
}

void CheckHashToken(FuzzedDataProvider& input)
{
    const size_t count = input.ConsumeIntegralInRange<size_t>(1, 12);
    std::vector<std::string> names;
    for (size_t i = 0; i < count; ++i)
        names.push_back(TakeCString(input, 12));
    const bool sorted = input.ConsumeBool();
    if (sorted) {
        std::sort(names.begin(), names.end(),
                  [](const std::string& a, const std::string& b) { return _stricmp(a.c_str(), b.c_str()) < 0; });
    }
    // Values are the row numbers, so a result names its row.
    std::vector<_tokenHash> table;
    for (size_t i = 0; i < count; ++i)
        table.push_back({names[i].c_str(), static_cast<int>(i)});

    const int last = static_cast<int>(count) - 1;
    const int low = input.ConsumeIntegralInRange(-2, last);
    const int high = input.ConsumeIntegralInRange(-2, last);
    std::string token = input.ConsumeBool() && !names.empty()
                            ? names[input.ConsumeIntegralInRange<size_t>(0, count - 1)]
                            : std::string();
    token += TakeCString(input, 8);
    if (input.ConsumeBool())
        std::transform(token.begin(), token.end(), token.begin(),
                       [](char c) { return static_cast<char>(toupper(static_cast<unsigned char>(c))); });

    const int exact = HashToken(token.c_str(), table.data(), high, low, 1);
    const int loose = HashToken(token.c_str(), table.data(), high, low, 0);
    if (low < 0 || high < low) {
        FUZZ_CHECK(exact == -1 && loose == -1);
        return;
    }
    int firstEqual = -1;
    int lastPrefix = -1;
    for (int row = low; row <= high; ++row) {
        if (firstEqual < 0 && strcasecmp(names[row].c_str(), token.c_str()) == 0)
            firstEqual = row;
        if (IsPrefix(names[row], token))
            lastPrefix = row;
    }
    FUZZ_CHECK(exact == firstEqual);
    if (sorted) {
        FUZZ_CHECK(loose == lastPrefix);
    } else {
        // Unsorted: some matching row, and -1 only when none matches.
        FUZZ_CHECK((loose == -1) == (lastPrefix == -1));
        FUZZ_CHECK(loose == -1 || (loose >= low && loose <= high && IsPrefix(names[loose], token)));
    }
}

// The scan of the contract: non-digits are skipped, and a digit that makes
// the value smaller (signed for _atoi64) ends it.
template <typename Value>
Value ModelDigits(const std::string& text)
{
    Value value = 0;
    for (char c : text) {
        if (c < '0' || c > '9')
            continue;
        const Value next = static_cast<Value>(static_cast<uint64_t>(value) * 10 + static_cast<uint64_t>(c - '0'));
        if (next < value)
            break;
        value = next;
    }
    return value;
}

void CheckTextToNumber(FuzzedDataProvider& input)
{
    const std::string text = TakeCString(input, 64);
    const unsigned long long unsignedValue = _atoui64(text.c_str());
    FUZZ_CHECK(unsignedValue == ModelDigits<unsigned long long>(text));
    const long long signedValue = _atoi64(text.c_str());
    const long long magnitude = ModelDigits<long long>(text);
    FUZZ_CHECK(magnitude >= 0);
    FUZZ_CHECK(signedValue == (!text.empty() && text[0] == '-' ? -magnitude : magnitude));

    // A plain decimal that fits reads as strtoull reads it.
    if (!text.empty() && text.size() <= 19 &&
        std::all_of(text.begin(), text.end(), [](char c) { return c >= '0' && c <= '9'; }))
        FUZZ_CHECK(unsignedValue == strtoull(text.c_str(), nullptr, 10));
}

// `text` must be `pattern` in `radix`, with a minus sign for `negative`.
void CheckDigits(const char* text, unsigned long long pattern, int radix, bool negative)
{
    if (radix < 2 || radix > 36) {
        FUZZ_CHECK(text[0] == '\0');
        return;
    }
    const char* digits = text;
    if (negative) {
        FUZZ_CHECK(*digits == '-');
        ++digits;
    }
    FUZZ_CHECK(*digits != '\0');
    for (const char* p = digits; *p; ++p)
        FUZZ_CHECK((*p >= '0' && *p <= '9') || (*p >= 'a' && *p <= 'z'));
    FUZZ_CHECK(digits[0] != '0' || digits[1] == '\0');
    FUZZ_CHECK(strtoull(digits, nullptr, radix) == pattern);
}

void CheckNumberToText(FuzzedDataProvider& input)
{
    const int radix = input.ConsumeBool() ? input.ConsumeIntegralInRange(-1, 40) : input.ConsumeIntegral<int>();
    const uint64_t bits = input.ConsumeIntegral<uint64_t>();
    std::unique_ptr<char[]> out(new char[kNumberRoom]);

    const int i32 = static_cast<int>(static_cast<uint32_t>(bits));
    FUZZ_CHECK(rv_itoa(i32, out.get(), radix) == out.get());
    const bool negative32 = radix == 10 && i32 < 0;
    CheckDigits(out.get(), negative32 ? 0u - static_cast<uint32_t>(i32) : static_cast<uint32_t>(i32), radix,
                negative32);

    const long l64 = static_cast<long>(bits);
    rv_ltoa(l64, out.get(), radix);
    const bool negative64 = radix == 10 && l64 < 0;
    CheckDigits(out.get(), negative64 ? 0ull - bits : bits, radix, negative64);

    rv_ultoa(static_cast<unsigned long>(bits), out.get(), radix);
    CheckDigits(out.get(), bits, radix, false);

    _i64toa(static_cast<long long>(bits), out.get(), radix);
    CheckDigits(out.get(), negative64 ? 0ull - bits : bits, radix, negative64);

    _ui64toa(bits, out.get(), radix);
    CheckDigits(out.get(), bits, radix, false);
}

void CheckTimeFormat(FuzzedDataProvider& input)
{
    const rvTime instant(static_cast<time_t>(input.ConsumeIntegral<int64_t>()), true);
    const int size = input.ConsumeIntegralInRange(-4, 300);
    const std::string format = TakeCString(input, 64);
    // A size below 1 writes nothing: a block of no bytes shows any write.
    std::unique_ptr<char[]> out(new char[size > 0 ? size : 0]);
    const char* formats[] = {format.c_str(), nullptr};
    for (const char* f : formats) {
        FUZZ_CHECK(instant.Format(f, out.get(), size) == out.get());
        if (size > 0)
            FUZZ_CHECK(strlen(out.get()) < static_cast<size_t>(size));
        FUZZ_CHECK(instant.FormatGmt(f, out.get(), size) == out.get());
        if (size > 0)
            FUZZ_CHECK(strlen(out.get()) < static_cast<size_t>(size));
    }
}

// The directives of rvTimeSpan::Format, written out the plain way.
std::string ModelSpan(const std::string& format, long span)
{
    std::string result;
    char number[32];
    for (size_t i = 0; i < format.size(); ++i) {
        if (format[i] != '%') {
            result += format[i];
            continue;
        }
        if (++i == format.size())
            break;
        switch (format[i]) {
        case 'D':
            snprintf(number, sizeof number, "%ld", span / 86400);
            break;
        case 'H':
            snprintf(number, sizeof number, "%02ld", span / 3600 - 24 * (span / 86400));
            break;
        case 'M':
            snprintf(number, sizeof number, "%02ld", span / 60 - 60 * (span / 3600));
            break;
        case 'S':
            snprintf(number, sizeof number, "%02ld", span % 60);
            break;
        default:
            number[0] = format[i];
            number[1] = '\0';
            break;
        }
        result += number;
    }
    return result;
}

void CheckSpanFormat(FuzzedDataProvider& input)
{
    const long seconds =
        input.ConsumeBool() ? input.ConsumeIntegralInRange<long>(-400000, 400000) : input.ConsumeIntegral<long>();
    const rvTimeSpan span(seconds);
    const std::string format = TakeCString(input, 128);
    const std::string expected = ModelSpan(format, seconds);
    // Exactly the room the result needs: the function has no bound of its own.
    std::unique_ptr<char[]> out(new char[expected.size() + 1]);
    FUZZ_CHECK(span.Format(format.c_str(), out.get(), 0) == out.get());
    FUZZ_CHECK(expected == out.get());
}

void CheckStrings(FuzzedDataProvider& input)
{
    std::string text = TakeCString(input, 64);
    const std::string pattern = TakeCString(input, 8);
    std::vector<char> heapText(text.begin(), text.end());
    heapText.push_back('\0');
    heapText.shrink_to_fit();
    char* found = _strstri(heapText.data(), pattern.c_str());
    char* expected = nullptr;
    if (!pattern.empty()) {
        for (size_t i = 0; i + pattern.size() <= text.size() && !expected; ++i) {
            if (strncasecmp(text.c_str() + i, pattern.c_str(), pattern.size()) == 0)
                expected = heapText.data() + i;
        }
    }
    FUZZ_CHECK(found == expected);

    found = _strrstri(heapText.data(), pattern.c_str());
    expected = nullptr;
    if (!pattern.empty()) {
        for (size_t i = 0; i + pattern.size() < text.size(); ++i) {
            if (strncasecmp(text.c_str() + i, pattern.c_str(), pattern.size()) == 0)
                expected = heapText.data() + i;
        }
    }
    FUZZ_CHECK(found == expected);

    const unsigned n = input.ConsumeIntegralInRange(0u, 80u);
    std::unique_ptr<char[]> dest(new char[n > 0 ? n : 1]);
    rv_safe_strcpy(dest.get(), text.c_str(), n);
    FUZZ_CHECK(dest[n > 0 ? n - 1 : 0] == '\0');
    FUZZ_CHECK(strncmp(dest.get(), text.c_str(), n > 0 ? n - 1 : 0) == 0);

    std::string lower = text;
    std::string upper = text;
    _strlwr(lower.data());
    _strupr(upper.data());
    FUZZ_CHECK(strcasecmp(lower.c_str(), text.c_str()) == 0 && strcasecmp(upper.c_str(), text.c_str()) == 0);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    FuzzedDataProvider input(data, size);
    switch (input.ConsumeIntegralInRange(0, 6)) {
    case 0:
        CheckHashToken(input);
        break;
    case 1:
        CheckTextToNumber(input);
        break;
    case 2:
        CheckNumberToText(input);
        break;
    case 3:
        CheckTimeFormat(input);
        break;
    case 4:
        CheckSpanFormat(input);
        break;
    default:
        CheckStrings(input);
        break;
    }
    return 0;
}
