/*
 * A C host of the plain-named interface: text helpers, path services, the
 * Twofish engine, the text encryption entry points and the handle calls.
 * Built as C11 with -pedantic; exits non-zero when a result is wrong.
 */
#define _XOPEN_SOURCE 700

#include <errno.h>
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
    if (!ok) {
        fprintf(stderr, "FAILED: %s\n", what);
        ++failures;
    }
}

static void checkText(const char* actual, const char* expected, const char* what)
{
    if (actual == NULL || strcmp(actual, expected) != 0) {
        fprintf(stderr, "FAILED: %s: \"%s\", expected \"%s\"\n", what,
                actual == NULL ? "(null)" : actual, expected);
        ++failures;
    }
}

static void textHelpers(void)
{
    char mixed[] = "MiXeD";
    char haystack[] = "Find the NEEDLE here";
    char dotted[] = "a.b.c";
    char copy[8] = "zzzzzzz";
    char number[80];

    check(_stricmp("Hello", "HELLO") == 0 && _stricmp("a", "B") < 0, "_stricmp");
    check(_strnicmp("HelloX", "helloY", 5) == 0 && _strnicmp("HelloX", "helloY", 6) != 0,
          "_strnicmp");
    checkText(_strlwr(mixed), "mixed", "_strlwr");
    checkText(_strupr(mixed), "MIXED", "_strupr");
    check(_strstri(haystack, "needle") == haystack + 9, "_strstri finds the upper-case match");
    check(_strstri(haystack, "") == NULL, "_strstri with an empty pattern");
    check(_strrstri(dotted, ".B") == dotted + 1, "_strrstri");
    check(_strrstri(dotted, ".c") == NULL, "_strrstri ignores a match at the end");
    check(rv_lowerTable['Q'] == 'q' && rv_lowerTable['q'] == 'q', "rv_lowerTable");

    rv_safe_strcpy(copy, "abcdef", 4);
    checkText(copy, "abc", "rv_safe_strcpy cuts");

    checkText(rv_itoa(-255, number, 10), "-255", "rv_itoa radix 10");
    checkText(rv_itoa(-1, number, 16), "ffffffff", "rv_itoa two's complement");
    checkText(rv_ltoa(-1, number, 16), "ffffffffffffffff", "rv_ltoa is 64 bits");
    checkText(rv_ultoa(255, number, 2), "11111111", "rv_ultoa radix 2");
    checkText(_i64toa(INT64_MIN, number, 10), "-9223372036854775808", "_i64toa");
    checkText(_ui64toa(UINT64_MAX, number, 36), "3w5e11264sgsf", "_ui64toa radix 36");
    checkText(rv_itoa(5, number, 1), "", "rv_itoa radix 1");
    check(_atoi64("-12") == -12 && _atoi64("1-2") == 12, "_atoi64");
    check(_atoui64("-5") == 5 && _atoui64(NULL) == 0, "_atoui64");
}

static void pathServices(const char* root)
{
    char deep[PATH_MAX];
    char detour[PATH_MAX];
    char missing[PATH_MAX];
    char resolved[PATH_MAX];
    char expected[PATH_MAX];
    char small[5];

    snprintf(deep, sizeof deep, "%s/a/b/c", root);
    snprintf(detour, sizeof detour, "%s/a/b/c/..", root);
    snprintf(missing, sizeof missing, "%s/missing", root);

    check(CreateDir(deep, 0) == 1 && FileExists(deep) == 1, "CreateDir makes the parents");
    check(CreateDir(deep, 0) == 1, "CreateDir of an existing directory");
    check(FileExists(missing) == 0 && errno == ENOENT, "FileExists of a missing name");

    check(realpath(detour, expected) != NULL, "realpath of the test tree");
    checkText(GetFullDirectoryName(detour, resolved, sizeof resolved), expected,
              "GetFullDirectoryName resolves");
    checkText(GetFullDirectoryName("/no/such/dir", small, sizeof small), "/no/",
              "GetFullDirectoryName cuts an unresolved name");

    check(DiskFreeSpace(root) > 0, "DiskFreeSpace of the test tree");
    check(DiskFreeSpace(missing) == 0, "DiskFreeSpace of a missing name");
}

static void twofishEngine(void)
{
    static const unsigned char kZeroKeyZeroBlock[16] = {0xA2, 0xFB, 0x66, 0x0C, 0x9A, 0x92,
                                                        0xBA, 0xF3, 0x45, 0x29, 0xFD, 0x18,
                                                        0xD9, 0x9B, 0x81, 0xAE};
    keyInstance key;
    cipherInstance cipher;
    unsigned char block[BLOCK_SIZE / 8] = {0};
    unsigned char back[BLOCK_SIZE / 8];
    char keyText[] = "00112233";
    char ivText[] = "00";

    memset(&key, 0, sizeof key);
    memset(&cipher, 0, sizeof cipher);
    check(makeKey(&key, DIR_ENCRYPT, 128, NULL) == TRUE && key.numRounds == 16, "makeKey");
    check(reKey(&key) == TRUE, "reKey");
    check(cipherInit(&cipher, MODE_ECB, NULL) == TRUE, "cipherInit");

    check(blockEncrypt(&cipher, &key, block, BLOCK_SIZE, block) == BLOCK_SIZE, "blockEncrypt");
    check(memcmp(block, kZeroKeyZeroBlock, sizeof block) == 0, "the engine's byte order");
    check(blockDecrypt(&cipher, &key, block, BLOCK_SIZE, back) == BLOCK_SIZE, "blockDecrypt");
    check(back[0] == 0 && memcmp(back, back + 1, sizeof back - 1) == 0,
          "blockDecrypt turns the key round");

    check(makeKey(&key, DIR_ENCRYPT, 128, keyText) == BAD_KEY_MAT, "makeKey refuses key text");
    check(cipherInit(&cipher, MODE_CBC, ivText) == BAD_IV_MAT, "cipherInit refuses IV text");
}

static void textEncryption(void)
{
    unsigned char data[] = "from C";
    char text[64];
    char plain[] = "plain";
    unsigned char out[16];
    unsigned long length = sizeof out;
    unsigned int wasPlain = 1;

    check(RVUI_Encrypt(data, 6, text) == 1, "RVUI_Encrypt");
    check(strlen(text) == 36 && strncmp(text, "D9", 2) == 0 && strcmp(text + 34, "AB") == 0,
          "RVUI_Encrypt writes one marked block");
    check(RVUI_Decrypt(text, out, &length, &wasPlain) == 1, "RVUI_Decrypt");
    check(length == 6 && wasPlain == 0 && memcmp(out, data, 6) == 0, "RVUI_Decrypt round trip");

    length = sizeof out;
    check(RVUI_Decrypt(plain, out, &length, &wasPlain) == 1, "RVUI_Decrypt of clear text");
    check(length == 5 && wasPlain == 1 && strcmp((char*)out, "plain") == 0,
          "clear text comes back as it was");
}

static void handleCalls(const char* root)
{
    char path[PATH_MAX];
    char buffer[8] = {0};
    unsigned long done = 0;
    unsigned long high = 1;
    void* handle;

    snprintf(path, sizeof path, "%s/data.bin", root);
    handle = CreateFile(path, O_RDWR | O_CREAT, 0, NULL, O_TRUNC, 0644, NULL);
    check(handle != (void*)-1, "CreateFile creates");
    if (handle == (void*)-1) {
        return;
    }

    check(WriteFile(handle, "0123456789", 10, &done, NULL) == 1 && done == 10, "WriteFile");
    check(GetFileSize64(handle) == 10, "GetFileSize64");
    check(GetFileSize(handle, &high) == 10 && high == 0, "GetFileSize");
    check(SetFilePointer64(handle, 2, SEEK_SET) == 2, "SetFilePointer64");
    check(ReadFile(handle, buffer, 4, &done, NULL) == 1 && done == 4, "ReadFile");
    checkText(buffer, "2345", "ReadFile reads from the position");
    check(SetFilePointer64(handle, 0, SEEK_END) == 10, "SetFilePointer64 to the end");
    check(ReadFile(handle, buffer, 4, &done, NULL) == 1 && done == 0, "ReadFile at the end");
    check(Lock(handle, 1) == 1 && Unlock(handle) == 1, "Lock and Unlock");
    check(CloseHandle(handle) == 1, "CloseHandle");

    handle = CreateFile(path, O_RDWR | O_CREAT | O_EXCL, 0, NULL, 0, 0644, NULL);
    check(handle == (void*)-1 && errno == EEXIST, "CreateFile refuses an existing file");
    check(ReadFile((void*)-1, buffer, 4, &done, NULL) == 0 && done == (unsigned long)-1 &&
              errno == EBADF,
          "ReadFile of the invalid handle");
    unlink(path);
}

int main(void)
{
    const char* tmp = getenv("TMPDIR");
    char root[256];
    char name[PATH_MAX];
    const char* tree[] = {"a/b/c", "a/b", "a"};
    size_t i;

    snprintf(root, sizeof root, "%s/tessaline-c-host-XXXXXX", tmp != NULL && *tmp ? tmp : "/tmp");
    if (mkdtemp(root) == NULL) {
        perror("mkdtemp");
        return 2;
    }

    textHelpers();
    pathServices(root);
    twofishEngine();
    textEncryption();
    handleCalls(root);

    for (i = 0; i < sizeof tree / sizeof tree[0]; ++i) {
        snprintf(name, sizeof name, "%s/%s", root, tree[i]);
        rmdir(name);
    }
    rmdir(root);

    if (failures != 0) {
        fprintf(stderr, "%d check(s) failed\n", failures);
        return 1;
    }
    puts("C host: all checks passed");
    return 0;
}
