// Tree comparison by kind and size, and file sizes.
#include "tessaline/files/rvCopy.h"

#include <cstring>

#include <sys/stat.h>
#include <unistd.h>

#include "files/handle.h"
#include "files/sys.h"
#include "tessaline/files/rvDirIterator.h"
#include "tessaline/files/rvFilename.h"

using tessaline::files::Sys;

int CompareDirectoriesByFileSize(const char* first, const char* second)
{
    rvFilename a(first, 0);
    rvFilename b(second, 0);
    if (Sys().access(b, F_OK) != 0) {
        return 0;
    }
    for (rvDirIterator entry(first); entry != rvDirIterator(); ++entry) {
        if (std::strcmp(*entry, ".") == 0 || std::strcmp(*entry, "..") == 0) {
            continue;
        }
        b.Join(nullptr, nullptr, second, *entry, nullptr);
        a.Join(nullptr, nullptr, first, *entry, nullptr);
        const int firstIsDirectory = rvFilename::IsDirectory(a);
        const int secondIsDirectory = rvFilename::IsDirectory(b);
        if (firstIsDirectory == 1 && secondIsDirectory == 1) {
            if (CompareDirectoriesByFileSize(a, b) == 0) {
                return 0;
            }
            continue;
        }
        if (firstIsDirectory == 1 || secondIsDirectory == 1) {
            return 0;
        }
        if (Sys().access(b, F_OK) != 0 || rvGetFileSize(a) != rvGetFileSize(b)) {
            return 0;
        }
    }
    return 1;
}

int64_t rvGetFileSize(const char* path)
{
    rvFilename name(path, 0);
    struct stat info;
    return Sys().stat(name, &info) == 0 ? static_cast<int64_t>(info.st_size) : 0;
}

int64_t rvGetFileSize64(void* handle)
{
    struct stat info;
    return Sys().fstat(tessaline::files::Descriptor(handle), &info) == 0 ? static_cast<int64_t>(info.st_size) : -1;
}
