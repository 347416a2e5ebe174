#include "tessaline/files/rvFilename.h"

#include <string.h>
#include <strings.h>

#include "files/path_limits.h"
#include "tessaline/util/rvString.h"

namespace {

using tessaline::files::kMaxSplitLength;
using tessaline::files::kPathWorkArea;

size_t BlockSize(size_t length)
{
    return (length + 4) & ~size_t{3};
}

// A zero-filled block with room for `length` characters and the NUL.
char* NewText(size_t length)
{
    return new char[BlockSize(length)]();
}

// Replaces *field by a copy of exactly `length` characters at `begin`.
void StoreCut(char** field, const char* begin, size_t length)
{
    char* copy = NewText(length);
    memcpy(copy, begin, length);
    delete[] * field;
    *field = copy;
}

void BackslashesToSlashes(char* text)
{
    for (; *text; ++text) {
        if (*text == '\\') {
            *text = '/';
        }
    }
}

bool HasText(const char* text)
{
    return text && *text;
}

size_t LengthOf(const char* text)
{
    return text ? strlen(text) : 0;
}

bool IsRemoteScheme(const char* scheme)
{
    return strncasecmp(scheme, "ftp", 3) == 0 || strncasecmp(scheme, "http", 4) == 0;
}

// Appends parts to a block whose room was counted beforehand.
class TextBuilder {
public:
    explicit TextBuilder(size_t room) : m_text(NewText(room)), m_end(m_text) {}

    void Append(const char* part)
    {
        size_t length = strlen(part);
        memcpy(m_end, part, length);
        m_end += length;
    }
    bool Holds(const char* part) const { return strstr(m_text, part) != nullptr; }
    char* Release() { return m_text; }

private:
    char* m_text;
    char* m_end;
};

// The text that Join forms from its parts, before it is split again; the
// caller owns it.
char* JoinParts(const char* scheme, const char* server, const char* directory, const char* file, const char* ext)
{
    TextBuilder text(16 + LengthOf(scheme) + LengthOf(server) + LengthOf(directory) + LengthOf(file) + LengthOf(ext));
    if (HasText(scheme)) {
        text.Append(scheme);
        if (!text.Holds("://")) {
            text.Append("://");
        }
    }
    if (HasText(server)) {
        if (!text.Holds("://")) {
            text.Append("//");
        }
        text.Append(server);
    }
    if (HasText(directory)) {
        text.Append(directory);
        char last = directory[strlen(directory) - 1];
        if (last != '/' && last != '\\') {
            text.Append("/");
        }
    }
    if (HasText(file)) {
        text.Append(file);
    }
    if (HasText(ext)) {
        text.Append(".");
        text.Append(ext);
    }
    return text.Release();
}

// The first occurrence in `path` of the text that the given components join
// to, running to the end of `path`; "" when there is none.
const char* FindJoined(const char* path, const char* scheme, const char* server, const char* directory,
                       const char* file, const char* ext)
{
    if (!path) {
        return rvFilename::m_pNullStr;
    }
    rvFilename rebuilt;
    rebuilt.Join(scheme, server, directory, file, ext);
    const char* found = strstr(path, rebuilt());
    return found ? found : rvFilename::m_pNullStr;
}

}  // namespace

const char* const rvFilename::m_pNullStr = "";

rvFilename::rvFilename(const char* text, unsigned int remote)
    : m_pPath(nullptr),
      m_pScheme(nullptr),
      m_pServer(nullptr),
      m_pDirectory(nullptr),
      m_pFullDirectory(nullptr),
      m_pFile(nullptr),
      m_pExt(nullptr),
      m_remote(remote)
{
    m_pPath = Dup(text, -1);
    if (m_pPath) {
        Split(nullptr);
    }
}

rvFilename::rvFilename(const rvFilename& other) : rvFilename(nullptr, 0)
{
    *this = other;
}

rvFilename& rvFilename::operator=(const rvFilename& other)
{
    if (this == &other) {
        return *this;
    }
    return *this = other.m_pPath;
}

rvFilename& rvFilename::operator=(const char* text)
{
    if (text == m_pPath) {
        return *this;
    }
    if (m_pPath && text && _stricmp(text, m_pPath) == 0) {
        return *this;
    }
    // Copied before the old text goes, since `text` may point into it.
    char* copy = Dup(text, -1);
    delete[] m_pPath;
    m_pPath = copy;
    Clear();
    if (m_pPath) {
        Split(nullptr);
    }
    return *this;
}

rvFilename::~rvFilename()
{
    Clear();
    delete[] m_pPath;
}

void rvFilename::Clear()
{
    for (char** field : {&m_pScheme, &m_pServer, &m_pFullDirectory, &m_pDirectory, &m_pFile, &m_pExt}) {
        delete[] * field;
        *field = nullptr;
    }
}

char* rvFilename::Dup(const char* text, int length)
{
    if (!text) {
        return nullptr;
    }
    size_t size = BlockSize(length < 0 ? strlen(text) : static_cast<size_t>(length));
    char* block = new char[size];
    strncpy(block, text, size);
    block[size - 1] = '\0';
    return block;
}

char* rvFilename::Dup(char** field, const char* text, int length)
{
    char* copy = Dup(text, length);
    delete[] * field;
    *field = copy;
    return copy;
}

void rvFilename::Split(const char* text)
{
    if (text) {
        *this = text;
        return;
    }
    if (!HasText(m_pPath)) {
        return;
    }

    char work[kPathWorkArea];
    strncpy(work, m_pPath, kMaxSplitLength);
    work[kMaxSplitLength] = '\0';
    char* cursor = work;

    if (char* separator = strstr(work, "://")) {
        *separator = '\0';
        StoreCut(&m_pScheme, work, static_cast<size_t>(separator - work));
        BackslashesToSlashes(m_pScheme);
        cursor = separator + 1;
        if (strstr(cursor, "///")) {
            ++cursor;
        }
    }

    if (cursor[0] == '/' && cursor[1] == '/') {
        cursor += 2;
        if (!m_pScheme || strcasecmp(m_pScheme, "file") != 0) {
            size_t length = strcspn(cursor, "/");
            StoreCut(&m_pServer, cursor, length);
            BackslashesToSlashes(m_pServer);
            cursor += length;
        }
    }

    if (m_pScheme && IsRemoteScheme(m_pScheme)) {
        m_remote = 1;
    }

    if (strchr(cursor, '/')) {
        const char* directory = cursor;
        size_t length = strlen(directory);
        // Only a local name without wildcards may be a directory as a whole.
        if (strchr(directory, '*') || m_remote || !IsDirectory(directory)) {
            const char* lastSlash = strrchr(directory + 1, '/');
            length = lastSlash ? static_cast<size_t>(lastSlash - directory) + 1 : 1;
        }
        cursor += length;
        while (length > 1 && directory[length - 1] == '/') {
            --length;
        }
        StoreCut(&m_pDirectory, directory, length);
        BackslashesToSlashes(m_pDirectory);
    } else if (!*cursor || strcmp(cursor, ".") == 0 || strcmp(cursor, "..") == 0) {
        size_t length = strlen(cursor);
        StoreCut(&m_pDirectory, cursor, length);
        cursor += length;
    }

    if (char* dot = strrchr(cursor, '.')) {
        StoreCut(&m_pExt, dot + 1, strlen(dot + 1));
        *dot = '\0';
    }
    if (*cursor) {
        StoreCut(&m_pFile, cursor, strlen(cursor));
    }

    NormalizePath(m_pPath);
}

const char* rvFilename::Join(const char* scheme, const char* server, const char* directory, const char* file,
                             const char* ext)
{
    if (!scheme && !server && !directory && !file && !ext) {
        if (!m_pScheme && !m_pServer && !m_pDirectory && !m_pFile && !m_pExt) {
            return m_pNullStr;
        }
        return Join(m_pScheme, m_pServer, m_pDirectory, m_pFile, m_pExt);
    }

    // Every argument is read before the old text goes, so they may point
    // into this object.
    char* joined = JoinParts(scheme, server, directory, file, ext);
    delete[] m_pPath;
    m_pPath = joined;
    Split(nullptr);
    NormalizePath(m_pPath);
    return m_pPath;
}

const char* rvFilename::URL()
{
    return FindJoined(m_pPath, m_pScheme ? m_pScheme : "file", m_pServer, m_pDirectory, m_pFile, m_pExt);
}

const char* rvFilename::Pathname()
{
    return FindJoined(m_pPath, nullptr, nullptr, Directory(), File(), Ext());
}

const char* rvFilename::Filename()
{
    return FindJoined(m_pPath, nullptr, nullptr, nullptr, File(), Ext());
}

const char* rvFilename::LocalPath()
{
    return Pathname();
}

const char* rvFilename::Scheme()
{
    return m_pScheme ? m_pScheme : m_pNullStr;
}
const char* rvFilename::Server()
{
    return m_pServer ? m_pServer : m_pNullStr;
}
const char* rvFilename::FullDirectory()
{
    return m_pFullDirectory ? m_pFullDirectory : m_pNullStr;
}
const char* rvFilename::Directory()
{
    return m_pDirectory ? m_pDirectory : m_pNullStr;
}
const char* rvFilename::File()
{
    return m_pFile ? m_pFile : m_pNullStr;
}
const char* rvFilename::Ext()
{
    return m_pExt ? m_pExt : m_pNullStr;
}

const char* rvFilename::Scheme(const char* text)
{
    Dup(&m_pScheme, text, -1);
    return Join(nullptr, nullptr, nullptr, nullptr, nullptr);
}

const char* rvFilename::Server(const char* text)
{
    Dup(&m_pServer, text, -1);
    return Join(nullptr, nullptr, nullptr, nullptr, nullptr);
}

const char* rvFilename::Directory(const char* text)
{
    Dup(&m_pDirectory, text, -1);
    return Join(nullptr, nullptr, nullptr, nullptr, nullptr);
}

const char* rvFilename::File(const char* text)
{
    Dup(&m_pFile, text, -1);
    return Join(nullptr, nullptr, nullptr, nullptr, nullptr);
}

const char* rvFilename::Ext(const char* text)
{
    Dup(&m_pExt, text, -1);
    return Join(nullptr, nullptr, nullptr, nullptr, nullptr);
}

int rvFilename::IsDirectory()
{
    return m_pPath ? IsDirectory(m_pPath) : 0;
}

int rvFilename::IsURL()
{
    return m_pScheme && m_pServer ? 1 : 0;
}

int rvFilename::Empty(const char* text)
{
    if (!text) {
        text = m_pPath;
    }
    return HasText(text) ? 0 : 1;
}

int rvFilename::Exists(int mode)
{
    return m_pPath ? Exists(m_pPath, mode) : 0;
}

const char* rvFilename::operator()() const
{
    return m_pPath ? m_pPath : m_pNullStr;
}

rvFilename::operator const char*() const
{
    return m_pPath ? m_pPath : m_pNullStr;
}

int rvFilename::operator==(const rvFilename& other) const
{
    if (!m_pPath || !other.m_pPath) {
        return !m_pPath && !other.m_pPath ? 1 : 0;
    }
    return _stricmp(m_pPath, other.m_pPath) == 0 ? 1 : 0;
}

int rvFilename::operator<(const rvFilename& other) const
{
    if (!m_pPath) {
        return other.m_pPath ? 0 : 1;
    }
    if (!other.m_pPath) {
        return 0;
    }
    return _stricmp(m_pPath, other.m_pPath) > 0 ? 1 : 0;
}
