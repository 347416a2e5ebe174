// The slash translators and the file-system questions of rvFilename.
#include <string.h>

#include <algorithm>
#include <string>

#include "files/path_limits.h"
#include "files/sys.h"
#include "tessaline/files/rvFilename.h"

namespace {

using tessaline::files::kMaxTranslateLength;
using tessaline::files::kPathWorkArea;
using tessaline::files::Sys;

bool IsSlash(char c)
{
    return c == '/' || c == '\\';
}

char* Translate(char* text, char from, char to)
{
    for (size_t i = 0; i < kMaxTranslateLength && text[i]; ++i) {
        if (text[i] == from) {
            text[i] = to;
        }
    }
    return text;
}

// A rope without `from` is left as it is, so it stays shared.
rvFilename::rope& Translate(rvFilename::rope& path, char from, char to)
{
    if (path.find(from) == rvFilename::rope::npos) {
        return path;
    }
    std::string text(path.size(), '\0');
    path.copy(text.data());
    std::replace(text.begin(), text.end(), from, to);
    path = rvFilename::rope(text.data(), text.size());
    return path;
}

int DirectoryBit(const struct stat& info)
{
    return (info.st_mode & 040000) ? 1 : 0;
}

}  // namespace

char* rvFilename::XlatPathToUNIX(char* path)
{
    return path ? Translate(path, '\\', '/') : path;
}

char* rvFilename::NormalizePath(char* path)
{
    return XlatPathToUNIX(path);
}

char* rvFilename::XlatPathToDOS(char* path)
{
    if (!path) {
        return path;
    }
    char* start = path;
    if (char* separator = strstr(path, "://")) {
        start = separator + 3;
        while (*start == '/') {
            ++start;
        }
    }
    Translate(start, '/', '\\');
    return path;
}

rvFilename::rope& rvFilename::XlatPathToUNIX(rope& path)
{
    return Translate(path, '\\', '/');
}

rvFilename::rope& rvFilename::NormalizePath(rope& path)
{
    return XlatPathToUNIX(path);
}

rvFilename::rope& rvFilename::XlatPathToDOS(rope& path)
{
    return Translate(path, '/', '\\');
}

int rvFilename::IsDirectory(const char* path)
{
    if (!path || !*path) {
        return 0;
    }
    struct stat info;
    if (Sys().stat(path, &info) == 0) {
        return DirectoryBit(info);
    }
    size_t length = strlen(path);
    if (!IsSlash(path[length - 1])) {
        return 0;
    }

    // Trailing separators are forgiven one at a time; a loop rather than
    // recursion keeps the stack flat however many there are.
    char work[kPathWorkArea];
    length = std::min(length, kMaxTranslateLength);
    memcpy(work, path, length);
    work[--length] = '\0';
    while (length > 0) {
        if (Sys().stat(work, &info) == 0) {
            return DirectoryBit(info);
        }
        if (!IsSlash(work[length - 1])) {
            return 0;
        }
        work[--length] = '\0';
    }
    return 0;
}

int rvFilename::Exists(const char* path, int mode)
{
    return Sys().access(path ? path : "", mode) == 0 ? 1 : 0;
}
