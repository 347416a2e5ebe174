// rvCopyFile: files, wildcards and trees, copied, linked or moved.
#include "tessaline/files/rvCopy.h"

#include <algorithm>
#include <cstring>

#include <fcntl.h>
#include <sys/stat.h>

#include "files/sys.h"
#include "tessaline/files/rvDirIterator.h"
#include "tessaline/files/rvFileApi.h"
#include "tessaline/files/rvFilename.h"
#include "tessaline/files/rvPath.h"
#include "tessaline/util/HashToken.h"
#include "util/scheme_tokens.h"

using tessaline::files::Sys;

namespace {

constexpr size_t kCopyBufferSize = 0x4000;
constexpr int kReadWriteCreate = O_RDWR | O_CREAT;
constexpr int kSourceOpenMode = 0664;

void* const kInvalidHandle = reinterpret_cast<void*>(static_cast<intptr_t>(-1));

struct CopyOptions {
    unsigned int recurse;
    unsigned int overwrite;
    unsigned int link;
    unsigned int move;
    const char* aux1;
    const char* aux2;
    unsigned long mode;
};

int Copy(const char* source, const char* target, const CopyOptions& options)
{
    return rvCopyFile(source, target, options.recurse, options.overwrite, options.link,
                      options.move, options.aux1, options.aux2, options.mode);
}

bool IsWildcard(const char* path)
{
    return std::strpbrk(path, "*?") != nullptr;
}

bool IsDotOrDotDot(const char* name)
{
    return std::strcmp(name, ".") == 0 || std::strcmp(name, "..") == 0;
}

// Owns a handle until Close; the destructor closes one still open.
class OwnedHandle {
public:
    explicit OwnedHandle(void* handle) : m_handle(handle) {}
    ~OwnedHandle() { Close(); }
    OwnedHandle(const OwnedHandle&) = delete;
    OwnedHandle& operator=(const OwnedHandle&) = delete;

    bool IsOpen() const { return m_handle != kInvalidHandle; }
    void* Get() const { return m_handle; }

    // 1 when the handle closed cleanly (or was not open).
    int Close()
    {
        if (!IsOpen()) {
            return 1;
        }
        void* handle = m_handle;
        m_handle = kInvalidHandle;
        return CloseHandle(handle);
    }

private:
    void* m_handle;
};

// Writes all of `count` bytes, completing short writes; false when a write
// fails or makes no progress.
bool WriteAll(void* handle, const char* data, unsigned long count)
{
    while (count > 0) {
        unsigned long written = 0;
        if (WriteFile(handle, data, count, &written, nullptr) == 0 || written == 0) {
            return false;
        }
        data += written;
        count -= written;
    }
    return true;
}

// Copies the source's size in bytes, as it stood when the copy began. A read
// that finds the end early (the source shrank) fails; one that would pass
// the size (the source grew) is cut to it.
bool CopyBytes(void* from, void* to)
{
    int64_t left = rvGetFileSize64(from);
    if (left < 0) {
        return false;
    }
    char buffer[kCopyBufferSize];
    while (left != 0) {
        const unsigned long want =
            static_cast<unsigned long>(std::min<int64_t>(left, kCopyBufferSize));
        unsigned long got = 0;
        if (ReadFile(from, buffer, want, &got, nullptr) == 0 || got == 0) {
            return false;
        }
        if (!WriteAll(to, buffer, got)) {
            return false;
        }
        left -= static_cast<int64_t>(got);
    }
    return true;
}

bool SameFile(const char* first, const char* second)
{
    struct stat a;
    struct stat b;
    return Sys().stat(first, &a) == 0 && Sys().stat(second, &b) == 0 && a.st_dev == b.st_dev &&
           a.st_ino == b.st_ino;
}

bool IsRefusedScheme(rvFilename& name)
{
    const int scheme = HashToken(name.Scheme(), tessaline::g_schemeTokens,
                                 tessaline::kSchemeTokenLast, 0, 1);
    return scheme == tessaline::kSchemeFtp || scheme == tessaline::kSchemeHttp;
}

// The wildcard way: every match of `src` into the directory `dst`.
int CopyMatches(rvFilename& src, rvFilename& dst, const char* target, const CopyOptions& options)
{
    if (options.link != 0 && Sys().symlink(src.Directory(), dst.Directory()) == 0) {
        return 1;
    }
    if (CreateDir(dst, 0) == 0) {
        return 0;
    }
    int total = 0;
    for (rvDirIterator entry(src); entry != rvDirIterator(); ++entry) {
        if (IsDotOrDotDot(*entry)) {
            continue;
        }
        rvFilename item(*entry, 0);
        item.Directory(src.Directory());
        if (options.recurse == 0 && rvFilename::IsDirectory(item) == 1) {
            continue;
        }
        rvFilename to(target, 0);
        if (rvFilename::IsDirectory(to) == 1) {
            to.Join(nullptr, nullptr, to.Directory(), item.File(), item.Ext());
        }
        total += Copy(item, to, options);
    }
    return total;
}

// The single way: one file onto the file `dst`.
int CopyOne(rvFilename& src, rvFilename& dst, const char* target, const CopyOptions& options)
{
    if (Sys().access(src, F_OK) != 0) {
        return 0;
    }
    if (rvFilename::IsDirectory(src) == 1) {
        return Copy(src.File("*"), target, options);
    }
    unsigned int overwrite = options.overwrite;
    if (overwrite == 1 && CreateDir(dst.Directory(), 0) == 0) {
        return 0;
    }
    if (overwrite != 1 && Sys().access(dst, F_OK) == 0) {
        struct stat from;
        struct stat to;
        if (Sys().stat(src, &from) == 0 && Sys().stat(dst, &to) == 0) {
            if (from.st_mtime == to.st_mtime && from.st_size == to.st_size) {
                return 0;
            }
            overwrite = 1;
        }
    }
    if (IsRefusedScheme(src)) {
        return 0;
    }
    if (options.link != 0) {
        return Sys().symlink(src, dst) == 0 ? 1 : 0;
    }
    if (SameFile(src, dst)) {
        return 0;
    }

    OwnedHandle from(CreateFile(src, O_RDONLY | O_CLOEXEC, 0, nullptr, 0, kSourceOpenMode, nullptr));
    if (!from.IsOpen()) {
        return 0;
    }
    OwnedHandle to(CreateFile(dst, kReadWriteCreate | O_CLOEXEC, 0, nullptr,
                              overwrite != 0 ? O_TRUNC : O_EXCL, static_cast<int>(options.mode),
                              nullptr));
    if (!to.IsOpen()) {
        return 0;
    }
    bool copied = CopyBytes(from.Get(), to.Get());
    from.Close();
    copied = to.Close() == 1 && copied;

    if (!copied) {
        Sys().unlink(dst);
        return 0;
    }
    if (options.move != 0) {
        Sys().unlink(src);
    }
    return 1;
}

}  // namespace

int rvCopyFile(const char* source, const char* target, unsigned int recurse,
               unsigned int overwrite, unsigned int link, unsigned int move, const char* aux1,
               const char* aux2, unsigned long mode)
{
    if (source == nullptr || target == nullptr) {
        return 0;
    }
    const CopyOptions options = {recurse, overwrite, link, move, aux1, aux2, mode};
    rvFilename src(source, 0);
    rvFilename dst(target, 0);
    return IsWildcard(source) ? CopyMatches(src, dst, target, options)
                              : CopyOne(src, dst, target, options);
}
