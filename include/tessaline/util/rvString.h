/**
 * @file
 * @brief Text and number helpers with plain C names.
 *
 * Case-insensitive comparison and search, case conversion in place, a
 * bounded copy, number to text in any radix and text to 64-bit number.
 *
 * Text is NUL-terminated 8-bit characters. Nothing here allocates or reports
 * errors. Every buffer belongs to the caller, who provides the room: for the
 * conversions 33 characters for a 32-bit value in radix 2, 65 for a 64-bit
 * one, one more for a minus sign, plus the NUL.
 *
 * Thread safety: all functions are reentrant on their arguments. The case
 * conversions and comparisons follow the process's locale (LC_CTYPE);
 * rv_lowerTable is constant data.
 *
 * This header also compiles as C.
 */
#ifndef TESSALINE_UTIL_RVSTRING_H
#define TESSALINE_UTIL_RVSTRING_H

#include "tessaline/export.h"

TESSALINE_EXTERN_C_BEGIN

/** Maps every byte to itself except 'A'..'Z', which map to 'a'..'z'. */
TESSALINE_API extern const unsigned char rv_lowerTable[256];

/** strcasecmp(a, b): below, at or above 0 as `a` sorts before, with or after
 *  `b`, ignoring case. A null argument sorts before any text, and two nulls
 *  are equal. */
TESSALINE_API int _stricmp(const char* a, const char* b);

/** strncasecmp(a, b, n): as _stricmp over at most the first `n` characters.
 *  A null argument sorts before any text, and two nulls are equal. */
TESSALINE_API int _strnicmp(const char* a, const char* b, unsigned n);

/** Converts `s` in place to lower case by the locale's tolower and returns
 *  `s`. A null `s` gives null. Bytes are looked up as unsigned char, so text
 *  in an 8-bit locale converts in full. */
TESSALINE_API char* _strlwr(char* s);

/** Converts `s` in place to upper case by the locale's toupper and returns
 *  `s`; otherwise as _strlwr. */
TESSALINE_API char* _strupr(char* s);

/** The first position of `text` where `pattern` matches, ignoring case, or
 *  null. An empty `pattern` never matches (unlike strstr). A null `text` or
 *  `pattern` gives null. */
TESSALINE_API char* _strstri(char* text, const char* pattern);

/** The last position of `text` where `pattern` matches, ignoring case, but
 *  only among matches that end before the last character of `text`: a match
 *  that touches the end is not found, and a `pattern` as long as `text` gives
 *  null even when they are equal. An empty `pattern` never matches. A null
 *  `text` or `pattern` gives null. */
TESSALINE_API char* _strrstri(char* text, const char* pattern);

/** Copies `src` into `dest` up to and including its NUL, at most `n` bytes,
 *  then stores a NUL in dest[n - 1] (in dest[0] when `n` is 0, so `dest` needs
 *  at least one byte). The rest of `dest` is not padded: bytes between the
 *  end of a short `src` and dest[n - 1] keep their old values. Returns what
 *  memccpy returned: one past the copied NUL, or null if none was copied. */
TESSALINE_API void* rv_safe_strcpy(char* dest, const char* src, unsigned n);

/** Number to text in `radix` 2 to 36, digits above 9 in lower case; returns
 *  `out`. Only radix 10 writes a minus sign: a negative value in any other
 *  radix is written as its two's complement pattern, so rv_itoa(-1, out, 16)
 *  gives "ffffffff". A radix outside 2 to 36 writes the empty string. A null
 *  `out` gives null.
 *
 *  rv_itoa works on 32 bits, _i64toa and _ui64toa on 64. rv_ltoa and
 *  rv_ultoa take `long`, which is 64 bits wide on x86-64 Linux: there
 *  rv_ltoa(-1, out, 16) gives sixteen f where a 32-bit platform gives eight,
 *  and they need 65 characters of room in radix 2 (plus sign and NUL). */
/** @{ */
TESSALINE_API char* rv_itoa(int value, char* out, int radix);
TESSALINE_API char* rv_ltoa(long value, char* out, int radix);
TESSALINE_API char* rv_ultoa(unsigned long value, char* out, int radix);
TESSALINE_API char* _i64toa(long long value, char* out, int radix);
TESSALINE_API char* _ui64toa(unsigned long long value, char* out, int radix);
/** @} */

/** Text to number. Every character that is not a digit 0-9 is skipped, not a
 *  stop: "12a3" gives 123 and "1-2" gives 12. A digit that would make the
 *  value smaller ends the scan and the value so far is returned; a
 *  multiplication that wraps to a larger value goes unnoticed. _atoi64
 *  negates the result when the text begins with '-' (a minus sign elsewhere
 *  and any '+' mean nothing); _atoui64 ignores signs, so "-5" gives 5. A null
 *  or empty `s` gives 0. */
/** @{ */
TESSALINE_API long long _atoi64(const char* s);
TESSALINE_API unsigned long long _atoui64(const char* s);
/** @} */

TESSALINE_EXTERN_C_END

#endif
