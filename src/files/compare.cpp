// Tree comparison by kind and size, and file sizes.
//
// Below the paths the host names, both trees are read through the open
// descriptors of their directories, and the walk keeps its place on the
// heap. It reads through symbolic links; a directory already on the path it
// walks, on either side, is not entered again, and the trees then count as
// different.
#include "tessaline/files/rvCopy.h"

#include <cstring>
#include <deque>
#include <string>
#include <utility>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "files/handle.h"
#include "files/member_text.h"
#include "files/sys.h"
#include "files/tree.h"
#include "tessaline/files/rvFilename.h"

namespace tessaline::files {
namespace {

class TreeCompare {
public:
    int Run(const char* first, const char* second)
    {
        if (Sys().access(rvFilename(second, 0), F_OK) != 0) {
            return 0;
        }
        rvFilename directory(nullptr, 0);
        rvFilename pattern(nullptr, 0);
        SplitWalk(first, &directory, &pattern);
        // What cannot be listed walks nothing; a `second` that cannot be
        // opened lacks every member.
        if (!m_first.Push(Place::Host(directory), Links::kFollow)) {
            return 1;
        }
        Listing listing(m_first.At(0), pattern);
        if (!m_second.Push(Place::Host(second), Links::kFollow)) {
            unsigned char type = 0;
            return listing.Next(&type) == nullptr ? 1 : 0;
        }
        m_levels.push_back(Level{std::move(listing), first, second});
        bool same = true;
        while (same && !m_levels.empty()) {
            same = Step();
        }
        return same ? 1 : 0;
    }

private:
    // One pair of directories: the entries of the first, and the texts the
    // entry names are joined to on both sides.
    struct Level {
        Listing listing;
        std::string first;
        std::string second;
    };

    // Compares the next entry of the deepest pair, or ends that pair.
    bool Step()
    {
        Level& level = m_levels.back();
        unsigned char type = 0;
        const char* entry = level.listing.Next(&type);
        if (entry == nullptr) {
            m_levels.pop_back();
            m_first.Pop();
            m_second.Pop();
            return true;
        }
        // A member whose text passes the path limit, or names another
        // entry, cannot be reached: the trees differ.
        const size_t length = std::strlen(entry);
        const std::string first = JoinedText(level.first.c_str(), entry, length);
        const std::string second = JoinedText(level.second.c_str(), entry, length);
        if (!Names(level.first, first, entry) || !Names(level.second, second, entry) ||
            m_second.Depth() < m_first.Depth()) {
            return false;
        }
        const int firstDirectory = m_first.At(m_first.Depth() - 1);
        const int secondDirectory = m_second.At(m_second.Depth() - 1);
        struct stat firstInfo;
        struct stat secondInfo;
        const bool firstFound = firstDirectory >= 0 && Sys().fstatat(firstDirectory, entry, &firstInfo, 0) == 0;
        const bool secondFound = secondDirectory >= 0 && Sys().fstatat(secondDirectory, entry, &secondInfo, 0) == 0;
        const bool firstIsDirectory = firstFound && (firstInfo.st_mode & S_IFDIR) != 0;
        const bool secondIsDirectory = secondFound && (secondInfo.st_mode & S_IFDIR) != 0;
        if (firstIsDirectory && secondIsDirectory) {
            return Enter(Place{firstDirectory, entry, first.c_str()}, Place{secondDirectory, entry, second.c_str()});
        }
        if (firstIsDirectory || secondIsDirectory || !secondFound) {
            return false;
        }
        return (firstFound ? firstInfo.st_size : 0) == secondInfo.st_size;
    }

    // Opens a pair of member directories; false when either cannot be
    // entered, also when it is already on its side's path.
    bool Enter(const Place& first, const Place& second)
    {
        if (!m_first.Push(first, Links::kFollow)) {
            return false;
        }
        if (!m_second.Push(second, Links::kFollow)) {
            m_first.Pop();
            return false;
        }
        m_levels.push_back(Level{Listing(m_first.At(m_first.Depth() - 1), "*"), first.text, second.text});
        return true;
    }

    static bool Names(const std::string& directory, const std::string& text, const char* entry)
    {
        std::string name;
        return NameInside(directory.c_str(), text.c_str(), &name) && name == entry;
    }

    DirectoryStack m_first;
    DirectoryStack m_second;
    // A deque, so that a level stays in place while deeper ones are added.
    std::deque<Level> m_levels;
};

}  // namespace
}  // namespace tessaline::files

int CompareDirectoriesByFileSize(const char* first, const char* second)
{
    // The texts as rvFilename normalizes them: backslashes turned to "/".
    const rvFilename firstName(first, 0);
    const rvFilename secondName(second, 0);
    return tessaline::files::TreeCompare().Run(firstName, secondName);
}

int64_t rvGetFileSize(const char* path)
{
    rvFilename name(path, 0);
    struct stat info;
    return tessaline::files::Sys().stat(name, &info) == 0 ? static_cast<int64_t>(info.st_size) : 0;
}

int64_t rvGetFileSize64(void* handle)
{
    struct stat info;
    return tessaline::files::Sys().fstat(tessaline::files::Descriptor(handle), &info) == 0
               ? static_cast<int64_t>(info.st_size)
               : -1;
}
