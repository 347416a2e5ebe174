/**
 * @file
 * @brief The Twofish engine, in its own byte order, under plain C names.
 *
 * The Twofish block cipher (128-bit block, 16 rounds) behind the classic
 * block-cipher candidate interface, in its full-keying form: reKey expands
 * the key-dependent S-boxes into four 256-word tables so that the round
 * function is four table reads and three exclusive-ors.
 *
 * Byte order. This engine numbers the bytes of a 32-bit word from the most
 * significant end, and reads and writes the four words of a block as
 * big-endian numbers. It therefore produces other cipher bytes than a
 * standard Twofish: with an all-zero 128-bit key a zero block enciphers to
 * A2FB660C9A92BAF34529FD18D99B81AE. The text form of rvEncrypt.h depends on
 * this order. Key words are numbers: key32[i] is the i-th key word.
 *
 * Typical use:
 * @code
 *   keyInstance key;  cipherInstance cipher;
 *   makeKey(&key, DIR_ENCRYPT, 128, NULL);
 *   key.key32[0] = ...; key.key32[3] = ...;   // the key, as numbers
 *   reKey(&key);
 *   cipherInit(&cipher, MODE_ECB, NULL);
 *   blockEncrypt(&cipher, &key, in, 8 * inBytes, out);
 * @endcode
 *
 * Ownership: keyInstance and cipherInstance are plain structures of the
 * caller; the engine keeps no pointer to them and allocates nothing.
 *
 * Thread safety: any number of threads may use the engine at once on
 * instances of their own. A key is changed by blockEncrypt/blockDecrypt when
 * it was built for the other direction, so one key must not be shared by
 * threads that use both directions. MDStab is filled once, on the first
 * reKey, and is safe to meet from several threads: needToBuildMDS is cleared
 * only after the fill and with release ordering. TableOp's counter is atomic.
 *
 * Validation: apart from null instance pointers (which give the codes noted
 * below) nothing is checked; buffers must be as large as stated.
 *
 * The constants are int constants in C++ and enumerators in C. Each is
 * defined only if a host header has not already made the name a macro
 * (TRUE and BLOCK_SIZE are common ones), so either include order builds;
 * the host's macro then stands in its place.
 *
 * Port note: RS_MDS_Encode and ParseHexDword keep their unsigned long
 * arguments, which are 64 bits wide on x86-64; RS_MDS_Encode works on the
 * low 32 bits and its result is below 2^32. Every field of the instances
 * keeps its 32-bit width.
 */
#ifndef TESSALINE_CRYPT_TWOFISH_H
#define TESSALINE_CRYPT_TWOFISH_H

#include <stdint.h>

#include "tessaline/export.h"

/* Each classic name is defined only if a host header has not already made
   it a macro, so either include order builds. C++ gets int constants (no
   enum mismatches in mixed expressions), C gets enumerators. */
#ifndef DIR_ENCRYPT
#ifdef __cplusplus
constexpr int DIR_ENCRYPT = 0; /**< Key direction: encipher. */
#else
enum { DIR_ENCRYPT = 0 };
#endif
#endif
#ifndef DIR_DECRYPT
#ifdef __cplusplus
constexpr int DIR_DECRYPT = 1; /**< Key direction: decipher. */
#else
enum { DIR_DECRYPT = 1 };
#endif
#endif
#ifndef MODE_ECB
#ifdef __cplusplus
constexpr int MODE_ECB = 1; /**< Electronic code book. */
#else
enum { MODE_ECB = 1 };
#endif
#endif
#ifndef MODE_CBC
#ifdef __cplusplus
constexpr int MODE_CBC = 2; /**< Cipher block chaining on block words. */
#else
enum { MODE_CBC = 2 };
#endif
#endif
#ifndef MODE_CFB1
#ifdef __cplusplus
constexpr int MODE_CFB1 = 3; /**< One-bit cipher feedback. */
#else
enum { MODE_CFB1 = 3 };
#endif
#endif
#ifndef BLOCK_SIZE
#ifdef __cplusplus
constexpr int BLOCK_SIZE = 128; /**< Block size in bits. */
#else
enum { BLOCK_SIZE = 128 };
#endif
#endif
#ifndef MAX_KEY_SIZE
#ifdef __cplusplus
constexpr int MAX_KEY_SIZE = 64; /**< Characters of key text. */
#else
enum { MAX_KEY_SIZE = 64 };
#endif
#endif
#ifndef TRUE
#ifdef __cplusplus
constexpr int TRUE = 1; /**< Success. */
#else
enum { TRUE = 1 };
#endif
#endif
#ifndef BAD_KEY_MAT
#ifdef __cplusplus
constexpr int BAD_KEY_MAT = -2; /**< Key text refused (makeKey, reKey). */
#else
enum { BAD_KEY_MAT = -2 };
#endif
#endif
#ifndef BAD_IV_MAT
#ifdef __cplusplus
constexpr int BAD_IV_MAT = -8; /**< IV text refused (cipherInit). */
#else
enum { BAD_IV_MAT = -8 };
#endif
#endif
#ifndef BAD_ENDIAN
#ifdef __cplusplus
constexpr int BAD_ENDIAN = -9; /**< ParseHexDword parses nothing. */
#else
enum { BAD_ENDIAN = -9 };
#endif
#endif

/** A key and its schedule: made by makeKey, keyed through key32 and reKey.
    A plain structure of the caller's; it may be copied. */
typedef struct keyInstance {
    uint8_t direction;    /**< DIR_ENCRYPT or DIR_DECRYPT: current subkey order. */
    int32_t keyLen;       /**< Key size in bits, rounded up to a multiple of 64. */
    char keyMaterial[68]; /**< Unused apart from a NUL at index 64. */
    uint32_t keySig;      /**< Neither set nor tested. */
    int32_t numRounds;    /**< 16 for 128, 192 and 256 bits. */
    uint32_t key32[8];    /**< The key words; words behind the key size are 0. */
    uint32_t sboxKeys[4]; /**< The Reed-Solomon words, last one first. */
    uint32_t subKeys[40]; /**< 8 whitening words, then 16 pairs of round subkeys. */
    /** Key-dependent S-boxes combined with the MDS matrix, as one run of 1024
        words: index 2x serves byte 0 (bits 31-24) of the g input with value
        x, 2x+1 byte 1; 512+2x serves byte 2, 512+2x+1 byte 3. */
    uint32_t sBox8x32[4][256];
} keyInstance;

/** A cipher mode and its feedback state, made by cipherInit. A plain
    structure of the caller's; ECB never writes it. */
typedef struct cipherInstance {
    uint8_t mode;       /**< MODE_ECB, MODE_CBC or MODE_CFB1. */
    uint8_t IV[16];     /**< The CFB1 feedback register. */
    uint32_t cipherSig; /**< Neither set nor tested. */
    uint32_t iv32[4];   /**< The CBC chaining value, as four block words. */
} cipherInstance;

TESSALINE_EXTERN_C_BEGIN

/** The fixed permutations q0 and q1, in this order. */
TESSALINE_API extern const uint8_t P8x8[2][256];
/** q1, q0, q1, q0 followed by one column of the MDS matrix each, with the
   matrix output byte z0 in bits 31-24. Valid once needToBuildMDS is 0. */
TESSALINE_API extern uint32_t MDStab[4][256];
/** Rounds indexed by (key bits - 1) / 64: 0, 16, 16, 16. */
TESSALINE_API extern const int numRounds[4];
/** 1 until MDStab has been filled. Hosts that read it from several threads
   should read it atomically (__atomic_load_n). */
TESSALINE_API extern int needToBuildMDS;
/** "Optimized C": the form of the reference code; nothing reads it. */
TESSALINE_API extern const char moduleDescription[];
TESSALINE_API extern const char modeString[]; /**< "(Full keying)"; nothing reads it. */
TESSALINE_API extern int debug;               /**< 0; nothing reads it. */
TESSALINE_API extern int debugCompile;        /**< 0; nothing reads it. */

/** Records direction and keyLen (rounded up to a multiple of 64 bits), sets
   numRounds from the table (sizes above 256 bits take the 256-bit entry;
   64 bits or less, 0 and negative sizes included, get 0 rounds), clears
   key32 and stores a NUL at keyMaterial[64]. With a null or empty
   keyMaterial returns TRUE: set key32 and call reKey next. Key text is
   always refused with BAD_KEY_MAT, as is a null key. */
TESSALINE_API int makeKey(keyInstance* key, unsigned char direction, int keyLen, char* keyMaterial);

/** Builds MDStab if needed, then sboxKeys, subKeys and sBox8x32 from key32,
   keyLen and numRounds; for DIR_ENCRYPT the round subkey pairs are stored
   last first. The S-boxes are built for 128, 192 and 256 bits only and are
   left as they are for other sizes. Returns TRUE (BAD_KEY_MAT for a null
   key). */
TESSALINE_API int reKey(keyInstance* key);

/** Stores the mode. For MODE_ECB or a null IV returns TRUE and leaves IV and
   iv32 as the caller set them; IV text in another mode gives BAD_IV_MAT,
   as does a null cipher. */
TESSALINE_API int cipherInit(cipherInstance* cipher, unsigned char mode, char* IV);

/** Enciphers inputLen bits from input into outBuffer and returns inputLen.
   ECB and CBC work on whole blocks: a last partial block is processed as a
   full one, so both buffers need 16 * ceil(inputLen / 128) bytes. CBC
   carries iv32 from call to call. CFB1 works bit by bit (first bit = most
   significant bit of byte 0), updates IV and leaves the other bits of a
   last partial output byte alone. A key built for the other direction is
   turned round first. With 0 or a negative inputLen nothing is done and
   inputLen comes back; null pointers with a positive inputLen give 0. */
TESSALINE_API int blockEncrypt(cipherInstance* cipher, keyInstance* key, unsigned char* input, int inputLen,
                               unsigned char* outBuffer);

/** The inverse of blockEncrypt, with the same buffer rules. */
TESSALINE_API int blockDecrypt(cipherInstance* cipher, keyInstance* key, unsigned char* input, int inputLen,
                               unsigned char* outBuffer);

/** Parses nothing and always returns BAD_ENDIAN: key words are set as
   numbers in key32 instead. */
TESSALINE_API int ParseHexDword(int bits, char* srcTxt, unsigned long* d, char* dstTxt);

/** The (12,8) Reed-Solomon step over GF(2^8) mod 0x14D on whole words: k1 is
   worked in first, then k0, four byte steps each, most significant byte
   first. */
TESSALINE_API unsigned long RS_MDS_Encode(unsigned long k0, unsigned long k1);

/** Fills MDStab once in the life of the process and then clears
   needToBuildMDS; later calls do nothing. Safe from several threads. */
TESSALINE_API void BuildMDS(void);

/** Swaps the 16 round subkey pairs end for end (each pair keeps its order)
   and stores newDir in direction. */
TESSALINE_API void ReverseRoundSubkeys(keyInstance* key, unsigned char newDir);

/** dst[i] = src[i] ^ b for 256 bytes; dst may equal src. */
TESSALINE_API void Xor256(unsigned char* dst, unsigned char* src, unsigned char b);

/** Operation 2 resets a counter and returns 1; operation 3 counts and
   returns 0 for the first 49 calls after a reset, 1 from the 50th on; any
   other operation returns 1. */
TESSALINE_API int TableOp(int op);

TESSALINE_EXTERN_C_END

#endif
