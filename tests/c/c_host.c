/*
 * A C host of the plain-named interface: text helpers, path services, the
 * Twofish engine, the text encryption entry points and the handle calls.
 * Built as C11 with -pedantic, it shows that the headers are C and that the
 * types and structures mean the same on both sides; what each call does is
 * tested in the C++ suites. Names each wrong result and exits non-zero.
 */
#define _XOPEN_SOURCE 700

#include <fcntl.h>
#include <limits.h>
#include <stdint.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <unistd.h>

#include "tessaline/crypt/rvEncrypt.h"
#include "tessaline/crypt/twofish.h"
#include "tessaline/files/rvFileApi.h"
#include "tessaline/files/rvPath.h"
#include "tessaline/util/rvString.h"

static int failures = 0;

static void check(int ok, const char* what)
{
    if (!ok)
        fprintf(stderr, "FAILED: %s\n", what);
    failures += !ok;
}

static void textHelpers(void)
{
    char mixed[] = "MiXeD", haystack[] = "Find the NEEDLE here", copy[8] = "zzzzzzz", number[80];

    check(_stricmp("Hello", "HELLO") == 0 && _strnicmp("HelloX", "helloY", 5) == 0, "compare");
    check(strcmp(_strupr(_strlwr(mixed)), "MIXED") == 0 && rv_lowerTable['Q'] == 'q', "case");
    check(_strstri(haystack, "needle") == haystack + 9 && _strrstri(haystack, "here") == NULL, "search");
    check(rv_safe_strcpy(copy, "abcdef", 4) == NULL && strcmp(copy, "abc") == 0, "rv_safe_strcpy");
    check(strcmp(rv_itoa(-1, number, 16), "ffffffff") == 0, "rv_itoa converts 32 bits");
    /* long is 64 bits on x86-64, 32 on 32-bit x86. */
    check(strcmp(rv_ltoa(-1, number, 16), sizeof(long) == 8 ? "ffffffffffffffff" : "ffffffff") == 0,
          "rv_ltoa converts at the width of long");
    check(strcmp(rv_ultoa(255, number, 2), "11111111") == 0, "rv_ultoa");
    check(strcmp(_i64toa(INT64_MIN, number, 10), "-9223372036854775808") == 0, "_i64toa");
    check(strcmp(_ui64toa(UINT64_MAX, number, 36), "3w5e11264sgsf") == 0, "_ui64toa");
    check(_atoi64("-12") == -12 && _atoui64("-5") == 5, "text to number");
}

static void pathServices(const char* root)
{
    char deep[PATH_MAX], resolved[PATH_MAX], expected[PATH_MAX];

    snprintf(deep, sizeof deep, "%s/a/b", root);
    check(CreateDir(deep, 0) == 1 && FileExists(deep) == 1, "CreateDir makes the parents");
    snprintf(deep, sizeof deep, "%s/a/b/..", root);
    check(realpath(deep, expected) != NULL, "realpath of the test tree");
    check(strcmp(GetFullDirectoryName(deep, resolved, sizeof resolved), expected) == 0,
          "GetFullDirectoryName resolves");
    check(DiskFreeSpace(root) > 0, "DiskFreeSpace of the test tree");
    snprintf(deep, sizeof deep, "%s/a/b", root);
    check(rmdir(deep) == 0 && rmdir(expected) == 0, "the test tree goes");
}

static void encryption(void)
{
    /* A zero block under the all-zero 128-bit key, in the engine's byte order. */
    static const unsigned char kSealed[16] = {0xA2, 0xFB, 0x66, 0x0C, 0x9A, 0x92, 0xBA, 0xF3,
                                              0x45, 0x29, 0xFD, 0x18, 0xD9, 0x9B, 0x81, 0xAE};
    keyInstance key = {0};
    cipherInstance cipher;
    unsigned char zero[BLOCK_SIZE / 8] = {0}, block[BLOCK_SIZE / 8] = {0}, out[16], data[] = "from C";
    char text[64];
    unsigned long length = sizeof out;
    unsigned int wasPlain = 1;

    check(makeKey(&key, DIR_ENCRYPT, 128, NULL) == TRUE && reKey(&key) == TRUE &&
              cipherInit(&cipher, MODE_ECB, NULL) == TRUE,
          "keying");
    check(blockEncrypt(&cipher, &key, block, BLOCK_SIZE, block) == BLOCK_SIZE && memcmp(block, kSealed, 16) == 0,
          "blockEncrypt");
    check(blockDecrypt(&cipher, &key, block, BLOCK_SIZE, block) == BLOCK_SIZE && memcmp(block, zero, 16) == 0,
          "blockDecrypt");
    check(RVUI_Encrypt(data, 6, text) == 1 && strlen(text) == 36, "RVUI_Encrypt");
    check(RVUI_Decrypt(text, out, &length, &wasPlain) == 1 && length == 6 && wasPlain == 0 && memcmp(out, data, 6) == 0,
          "RVUI_Decrypt");
}

static void handleCalls(const char* root)
{
    char path[PATH_MAX], buffer[8] = {0};
    unsigned long done = 0, high = 1;
    void* handle;

    snprintf(path, sizeof path, "%s/data.bin", root);
    handle = CreateFile(path, O_RDWR | O_CREAT, 0, NULL, O_TRUNC, 0644, NULL);
    check(handle != (void*)-1, "CreateFile creates");
    check(WriteFile(handle, "0123456789", 10, &done, NULL) == 1 && done == 10, "WriteFile");
    check(GetFileSize64(handle) == 10 && GetFileSize(handle, &high) == 10 && high == 0, "file size");
    check(SetFilePointer64(handle, 2, SEEK_SET) == 2, "SetFilePointer64");
    check(ReadFile(handle, buffer, 4, &done, NULL) == 1 && strcmp(buffer, "2345") == 0, "ReadFile");
    check(Lock(handle, 1) == 1 && Unlock(handle) == 1 && CloseHandle(handle) == 1, "Lock, Unlock, Close");
    unlink(path);
}

int main(void)
{
    const char* tmp = getenv("TMPDIR");
    char root[256];

    snprintf(root, sizeof root, "%s/tessaline-c-host-XXXXXX", tmp != NULL && *tmp ? tmp : "/tmp");
    if (mkdtemp(root) == NULL) {
        perror("mkdtemp");
        return 2;
    }
    textHelpers();
    pathServices(root);
    encryption();
    handleCalls(root);
    rmdir(root);
    return failures == 0 ? 0 : 1;
}
