// Directory walks by pattern, with one shared representation per walk.
#include "tessaline/files/rvDirIterator.h"

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <cstring>
#include <memory>

#include <fnmatch.h>
#include <unistd.h>

#include "files/sys.h"
#include "files/tree.h"

using tessaline::files::Sys;

namespace {

// The entry buffer has room for the longest path the directory allows and a
// dirent header; the name of one entry needs far less.
constexpr long kMinimumPathMax = 4095;
constexpr long kEntryHeaderRoom = 0x10D;

struct DirCloser {
    void operator()(DIR* dir) const { Sys().closedir(dir); }
};

// readdir_r is deprecated; readdir on a stream that no one else reads is
// just as safe, and the entry is copied so that every copy of the iterator
// reads one stable buffer.
void CopyEntry(const dirent* from, dirent* to)
{
    std::memcpy(to, from, offsetof(dirent, d_name) + std::strlen(from->d_name) + 1);
}

void LetGo(rvDirIterator_rep*& rep)
{
    if (rep != nullptr && --rep->m_refs == 0) {
        delete rep;
    }
    rep = nullptr;
}

}  // namespace

rvDirIterator_rep::rvDirIterator_rep(const char* path)
    : m_error(0), m_dir(nullptr), m_refs(1), m_entry(nullptr), m_pattern(path, 0)
{
    rvFilename directory(nullptr, 0);
    tessaline::files::SplitWalk(path, &directory, &m_pattern);

    const char* place = directory;
    std::unique_ptr<DIR, DirCloser> dir(Sys().opendir(place));
    if (!dir) {
        return;
    }
    const long pathMax = std::max(Sys().pathconf(place, _PC_PATH_MAX), kMinimumPathMax);
    m_entry = reinterpret_cast<dirent*>(new char[pathMax + kEntryHeaderRoom]);
    m_dir = dir.release();
}

rvDirIterator_rep::~rvDirIterator_rep()
{
    if (m_dir != nullptr) {
        Sys().closedir(m_dir);
    }
    delete[] reinterpret_cast<char*>(m_entry);
}

int rvDirIterator_rep::get_next()
{
    if (m_dir == nullptr) {
        return 0;
    }
    const char* pattern = m_pattern;
    for (;;) {
        const int callerError = errno;
        errno = 0;
        const dirent* entry = Sys().readdir(m_dir);
        m_error = errno;
        if (m_error == 0) {
            errno = callerError;
        }
        if (entry == nullptr) {
            return 0;
        }
        // Matched where readdir left it, so that only the entries delivered
        // pay for the copy into the shared buffer.
        if (fnmatch(pattern, entry->d_name, FNM_PATHNAME) == 0) {
            CopyEntry(entry, m_entry);
            return 1;
        }
    }
}

rvDirIterator::rvDirIterator() : m_rep(nullptr), m_name(nullptr) {}

rvDirIterator::rvDirIterator(const char* path) : m_rep(new rvDirIterator_rep(path)), m_name(nullptr)
{
    if (m_rep->get_next() != 0) {
        m_name = m_rep->m_entry->d_name;
    } else {
        LetGo(m_rep);
    }
}

rvDirIterator::rvDirIterator(const rvDirIterator& other) : m_rep(other.m_rep), m_name(other.m_name)
{
    if (m_rep != nullptr) {
        ++m_rep->m_refs;
    }
}

rvDirIterator::~rvDirIterator()
{
    LetGo(m_rep);
}

// Taking the new reference before letting go of the old one makes
// self-assignment safe.
// NOLINTNEXTLINE(bugprone-unhandled-self-assignment,cert-oop54-cpp)
rvDirIterator& rvDirIterator::operator=(const rvDirIterator& other)
{
    rvDirIterator_rep* rep = other.m_rep;
    const char* name = other.m_name;
    if (rep != nullptr) {
        ++rep->m_refs;
    }
    LetGo(m_rep);
    m_rep = rep;
    m_name = name;
    return *this;
}

rvDirIterator& rvDirIterator::operator++()
{
    if (m_rep == nullptr) {
        return *this;
    }
    if (m_rep->get_next() != 0) {
        m_name = m_rep->m_entry->d_name;
    } else {
        LetGo(m_rep);
        m_name = nullptr;
    }
    return *this;
}

rvDirIterator rvDirIterator::operator++(int)
{
    rvDirIterator before(*this);
    ++*this;
    return before;
}

int rvDirIterator::operator==(const rvDirIterator& other) const
{
    if (m_rep == nullptr || other.m_rep == nullptr) {
        return m_rep == other.m_rep ? 1 : 0;
    }
    return m_name == other.m_name ? 1 : 0;
}

const char* rvDirIterator::operator*() const
{
    return m_name;
}
