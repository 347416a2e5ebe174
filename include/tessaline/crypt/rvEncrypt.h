/**
 * @file
 * @brief Reversible encryption of byte strings to printable text.
 *
 * The text forms sit on the Twofish engine of twofish.h in ECB mode. There
 * is no integrity protection: a wrong key or altered digits decrypt to other
 * bytes, returned as a success.
 *
 * Forms of text:
 * - hexadecimal text: the cipher bytes of the record, each complemented and
 *   written as two upper-case digits (32 per block);
 * - marked text: "D9" + hexadecimal text + "AB" (rvEncrypt; the key is the
 *   library's fixed key, the same for every host);
 * - chained text: exactly 80 hex digits holding up to 36 characters; read by
 *   rvDecrypt only, never written.
 *
 * The record enciphered for a payload of L bytes is L as a 4-byte
 * little-endian word, the payload, and zero bytes up to the end of the last
 * block: n = ((L + 3) >> 4) + 1 blocks. The zero filler makes one value
 * always encrypt to one text.
 *
 * Results are 1 for success and 0 for failure; nothing writes a message.
 * Output buffers are the caller's and come without a size: each function
 * says how much room it needs. Payloads of 2^28 - 4 bytes or more are
 * refused with 0 (the engine counts bits in an int).
 *
 * Thread safety: every function may run in any number of threads at once.
 * TwoFishEncrypt and TwoFishDecrypt key a cipher of their own on the stack
 * for each call; rvEncrypt and rvDecrypt share the fixed key's schedule,
 * which the first of them to run builds (threads that meet there wait for
 * it) and which is only read from then on.
 *
 * Port note: the length arguments are unsigned long, 64 bits on x86-64; the
 * length word of the record stays 32 bits, and TwoFishHere returns a full
 * 64-bit address.
 */
#ifndef TESSALINE_CRYPT_RVENCRYPT_H
#define TESSALINE_CRYPT_RVENCRYPT_H

#include "tessaline/export.h"

#ifdef __cplusplus

/// Enciphers `length` bytes of `data` with the key given as 32 or 64 hex
/// digits (128 or 256 bits; any other length, 48 digits included, gives 0).
/// A group of 8 key digits that is not hexadecimal takes the value strtoul
/// gives it. Writes 32n hex digits and a NUL to `out`, which needs room for
/// 32n + 1 characters. Returns 1, or 0 for null arguments, a refused key or
/// a failed allocation.
TESSALINE_API int TwoFishEncrypt(char* key, unsigned char* data, unsigned long length, char* out);

/// Deciphers hexadecimal text with the key given as for TwoFishEncrypt. On
/// entry *length is the capacity of `out`; on success it is the number of
/// bytes stored: the record's length word, cut to the capacity and to what
/// the text holds. `out` gets no NUL. Upper- and lower-case digits are
/// accepted; a pair that is not hexadecimal takes the value strtoul gives it.
/// A last odd character is dropped, and of text that is not a whole number
/// of blocks only the whole blocks are deciphered (shorter text gives an
/// empty payload); nothing is read or written past either buffer. A stored
/// length that disagrees with the text (wrong key, altered digits) is cut to
/// T - 4 bytes for text of T characters, bytes past the deciphered blocks
/// reading as 0. Returns 1, or 0 for null arguments, a refused key, a failed
/// allocation, or text of 2^29 characters or more.
TESSALINE_API int TwoFishDecrypt(char* key, char* text, unsigned char* out, unsigned long* length);

/// Marked text of `length` bytes of `data` under the fixed key, into `out`
/// with room for 32n + 5 characters. A length of 0 gives the empty string.
/// Returns 1, or 0 for a null `data` or `out`, a payload that is too long
/// or a failed allocation.
TESSALINE_API int rvEncrypt(unsigned char* data, unsigned long length, char* out);

/// Reads marked, chained or clear text into `out` (room for at least one
/// byte; out[0] is NUL first). *length is the capacity on entry. *wasPlain,
/// if given, is 0 for text that came out of the cipher and 1 otherwise.
///  - marked text ("D9", 32k digits, "AB"; head and tail case-sensitive) is
///    deciphered as TwoFishDecrypt does, with the fixed key; no NUL is added.
///  - any other text of exactly 80 characters is chained text: needs a
///    capacity of 37 (else 0); out gets the string and a NUL at out[36],
///    *length its length. A non-hex pair takes the value strtoul gives it.
///  - empty text: returns 1 and leaves *length alone.
///  - clear text of S characters is copied with its NUL if the capacity is
///    at least S + 1 (*length becomes S); otherwise the first capacity - 1
///    characters and a NUL are stored and *length is left alone. A capacity
///    of 0 counts as 1: out[0] holds the NUL.
///
/// Returns 1 on success (with no check that a wrong key was used), 0 for a
/// null text, out or length, a failed allocation or a capacity under 37 for
/// chained text.
TESSALINE_API int rvDecrypt(char* text, unsigned char* out, unsigned long* length, unsigned int* wasPlain);

/// The address this call will return to, that is, where it was called from.
/// The argument has no effect. The function is never inlined; under clang
/// the declaration also stops callers from making the call a tail jump
/// (under g++, call it from a statement that is not `return TwoFishHere(..)`).
#if defined(__clang__)
__attribute__((not_tail_called))
#endif
TESSALINE_API unsigned long TwoFishHere(unsigned long);

#endif /* __cplusplus */

TESSALINE_EXTERN_C_BEGIN

/** rvEncrypt under a plain name, for C hosts: marked text of `length` bytes
    of `data` into `out`, which needs room for 32n + 5 characters. */
TESSALINE_API int RVUI_Encrypt(unsigned char* data, unsigned long length, char* out);
/** rvDecrypt under a plain name, for C hosts: marked, chained or clear text
    into `out`; *length is the capacity on entry and the bytes stored on
    return, and *wasPlain (if given) tells whether the cipher was used. */
TESSALINE_API int RVUI_Decrypt(char* text, unsigned char* out, unsigned long* length, unsigned int* wasPlain);

TESSALINE_EXTERN_C_END

#endif
