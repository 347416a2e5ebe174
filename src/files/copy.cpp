// rvCopyFile: files, wildcards and trees, copied, linked or moved.
//
// Below the paths the host names, both sides of a tree copy are reached
// through the open descriptors of their directories, never by their texts
// again. The source side reads through symbolic links as it finds them; the
// target side never writes through one, and `move` removes only files that
// were not reached through a link to a directory. A source directory that
// is already on the walk's path (a link back up the tree) or that the copy
// writes into is not entered again.
#include "tessaline/files/rvCopy.h"

#include <cerrno>
#include <cstddef>
#include <cstring>
#include <deque>
#include <string>

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>

#include "files/copy_bytes.h"
#include "files/handle.h"
#include "files/member_text.h"
#include "files/open_at.h"
#include "files/scheme_tokens.h"
#include "files/sys.h"
#include "files/tree.h"
#include "tessaline/files/rvFilename.h"
#include "tessaline/files/rvPath.h"
#include "tessaline/util/HashToken.h"

namespace tessaline::files {
namespace {

constexpr int kReadWriteCreate = O_RDWR | O_CREAT;
constexpr int kSourceOpenMode = 0664;
constexpr mode_t kNewDirectoryMode = 06775;

struct CopyOptions {
    unsigned int recurse;
    unsigned int overwrite;
    unsigned int link;
    unsigned int move;
    unsigned long mode;
};

// One side of a copy. `below` marks a place under the path the host named;
// `throughLink` a source reached through a symbolic link to a directory.
struct End {
    Place place;
    bool below;
    bool throughLink;
};

bool IsWildcard(const char* path)
{
    return std::strpbrk(path, "*?") != nullptr;
}

int StatAt(const Place& place, struct stat* info)
{
    return Sys().fstatat(place.directory, place.name, info, 0);
}

int ExistsAt(const Place& place)
{
    return Sys().faccessat(place.directory, place.name, F_OK, 0) == 0;
}

bool IsSameFile(const struct stat& first, const struct stat& second)
{
    return first.st_dev == second.st_dev && first.st_ino == second.st_ino;
}

// Only a text with "://" has a scheme; the split is skipped for the others,
// as it asks the file system about the text.
bool IsRefusedScheme(const char* text)
{
    if (std::strstr(text, "://") == nullptr) {
        return false;
    }
    rvFilename name(text, 0);
    const int scheme = HashToken(name.Scheme(), g_schemeTokens, kSchemeTokenLast, 0, 1);
    return scheme == kSchemeFtp || scheme == kSchemeHttp;
}

// CreateDir for a target; below the host's path the parent is already open.
int MakeDirectory(const End& target)
{
    if (!target.below) {
        return CreateDir(target.place.text, 0);
    }
    if (ExistsAt(target.place)) {
        return 1;
    }
    if (errno != ENOENT) {
        return 0;
    }
    return Sys().mkdirat(target.place.directory, target.place.name, kNewDirectoryMode) == 0;
}

// The link of a wildcard's whole directory. Below the host's path the new
// name can only be the target itself; its directory exists, so a link there
// would fail anyway.
bool LinkDirectory(const char* existing, const End& target)
{
    rvFilename to(target.place.text, 0);
    if (!target.below) {
        return Sys().symlinkat(existing, AT_FDCWD, to.Directory()) == 0;
    }
    return std::strcmp(to.Directory(), target.place.text) == 0 &&
           Sys().symlinkat(existing, target.place.directory, target.place.name) == 0;
}

// The text that members of the target directory are joined to. Below the
// host's path it is the directory's own text, which the walk formed: a split
// would cut a text past its working limit, and a name with "*" as a pattern.
std::string IntoText(const End& target)
{
    return target.below ? target.place.text : rvFilename(target.place.text, 0).Directory();
}

// The whole copy of one call: the source directories it is in and the
// target directories it writes into, each on a stack of its own, and one
// level per source directory being walked.
class TreeCopy {
public:
    explicit TreeCopy(const CopyOptions& options) : m_options(options) {}

    int Run(const char* source, const char* target)
    {
        Visit(End{Place::Host(source), false, false}, End{Place::Host(target), false, false});
        while (!m_levels.empty()) {
            Step();
        }
        return m_total;
    }

private:
    // A source directory being walked, and where its members go: into the
    // target directory the level opened, or each onto one target in turn.
    struct Level {
        Listing listing;
        std::string memberDirectory;
        bool throughLink;
        bool into;
        std::string intoText;
        // The one target, when not `into`, in the deepest target directory
        // or at the host's path (targetLevel -1).
        std::string targetName;
        std::string targetText;
        bool targetBelow;
        ptrdiff_t targetLevel;
    };

    void Visit(const End& source, const End& target)
    {
        if (IsWildcard(source.place.text)) {
            Enter(source, source.place.text, target);
        } else {
            m_total += CopyOne(source, target);
        }
    }

    // The wildcard way: every match of `wildcardText` into the directory
    // `target`, as a new level that the main loop walks.
    void Enter(const End& source, const char* wildcardText, const End& target)
    {
        if (m_options.link != 0 && LinkDirectory(rvFilename(wildcardText, 0).Directory(), target)) {
            ++m_total;
            return;
        }
        if (MakeDirectory(target) == 0) {
            return;
        }
        // The target is judged once: a directory takes the members under
        // their own names; anything else takes every member in turn, unless
        // it is a link to a directory below the host's path, which is never
        // written into.
        const bool into = m_targets.Push(target.place, target.below ? Links::kRefuse : Links::kFollow);
        if (!into && target.below && IsDirectoryAt(target.place) == 1) {
            return;
        }
        const WalkPlan plan = PlanWalk(source.place, wildcardText);
        bool throughLink = source.throughLink;
        if (!EnterSource(source, plan, &throughLink)) {
            if (into) {
                m_targets.Pop();
            }
            return;
        }
        const ptrdiff_t deepestTarget = static_cast<ptrdiff_t>(m_targets.Depth()) - 1;
        m_levels.push_back(Level{Listing(m_sources.At(m_sources.Depth() - 1), plan.pattern.c_str()),
                                 plan.memberDirectory, throughLink, into, into ? IntoText(target) : std::string(),
                                 target.place.name, target.place.text, target.below,
                                 into || !target.place.IsHost() ? deepestTarget : -1});
    }

    // Opens the source directory of a walk. A directory already on the
    // walk's path, or one the copy writes into, is not entered (ELOOP).
    bool EnterSource(const End& source, const WalkPlan& plan, bool* throughLink)
    {
        bool entered = false;
        switch (plan.from) {
        case WalkFrom::kHostPath:
            entered = m_sources.Push(Place::Host(plan.directory.c_str()), Links::kFollow);
            break;
        case WalkFrom::kEntry: {
            const bool link = IsLinkAt(source.place);
            *throughLink = *throughLink || link;
            entered = m_sources.Push(source.place, link ? Links::kFollow : Links::kRefuse);
            break;
        }
        case WalkFrom::kEntryDirectory:
            errno = ELOOP;
            break;
        case WalkFrom::kNothing:
            break;
        }
        if (entered && m_targets.HoldsDeepestOf(m_sources)) {
            m_sources.Pop();
            errno = ELOOP;
            entered = false;
        }
        return entered;
    }

    // The next member of the deepest level, or the end of that level.
    void Step()
    {
        Level& level = m_levels.back();
        unsigned char type = DT_UNKNOWN;
        const char* entry = level.listing.Next(&type);
        const int sourceDirectory = entry != nullptr ? m_sources.At(m_sources.Depth() - 1) : -1;
        const int targetDirectory = level.targetLevel < 0 ? AT_FDCWD : m_targets.At(level.targetLevel);
        if (sourceDirectory < 0 || targetDirectory < 0) {
            Leave();
            return;
        }
        const std::string text = MemberText(level.memberDirectory.c_str(), entry);
        std::string fromName;
        if (!NameInside(level.memberDirectory.c_str(), text.c_str(), &fromName)) {
            return;
        }
        const End from{{sourceDirectory, fromName.c_str(), text.c_str()}, true, level.throughLink};
        if (m_options.recurse == 0 && IsDirectoryAt(from.place) == 1) {
            return;
        }
        if (!level.into) {
            Visit(from,
                  End{{targetDirectory, level.targetName.c_str(), level.targetText.c_str()}, level.targetBelow, false});
            return;
        }
        const std::string toText = MemberText(level.intoText.c_str(), entry);
        std::string toName;
        if (NameInside(level.intoText.c_str(), toText.c_str(), &toName)) {
            Visit(from, End{{targetDirectory, toName.c_str(), toText.c_str()}, true, false});
        }
    }

    void Leave()
    {
        m_sources.Pop();
        if (m_levels.back().into) {
            m_targets.Pop();
        }
        m_levels.pop_back();
    }

    // The single way: one file onto the file `target`; a directory becomes
    // a level of its own.
    int CopyOne(const End& source, const End& target)
    {
        // The source is opened first and examined through its handle, so
        // that what is copied is what was examined. Non-blocking, so that a
        // FIFO opens at once (and copies as its size, 0) instead of waiting
        // for a writer. Where it cannot be opened, a stat stands in for
        // `access` (for mere existence both fail alike), and the open is
        // tried again with the attempts of CreateFile only when needed.
        constexpr int kSourceAccess = O_RDONLY | O_NONBLOCK | O_CLOEXEC;
        OwnedHandle from(Handle(Sys().openat(source.place.directory, source.place.name, kSourceAccess, 0)));
        struct stat sourceInfo;
        const bool examined = from.IsOpen() ? Sys().fstat(Descriptor(from.Get()), &sourceInfo) == 0
                                            : StatAt(source.place, &sourceInfo) == 0;
        if (!examined) {
            return 0;
        }
        if (IsDirectoryAt(source.place, sourceInfo) == 1) {
            from.Close();
            // Below the host's path the text is not split again: the split
            // asks the file system, which may answer differently by now.
            const std::string wildcard =
                source.below ? std::string(source.place.text) + "/*" : rvFilename(source.place.text, 0).File("*");
            Enter(source, wildcard.c_str(), target);
            return 0;
        }
        unsigned int overwrite = m_options.overwrite;
        if (overwrite == 1 && !target.below && CreateDir(rvFilename(target.place.text, 0).Directory(), 0) == 0) {
            return 0;
        }
        struct stat targetInfo;
        const bool targetExists = StatAt(target.place, &targetInfo) == 0;
        if (overwrite != 1 && targetExists) {
            if (sourceInfo.st_mtime == targetInfo.st_mtime && sourceInfo.st_size == targetInfo.st_size) {
                return 0;
            }
            overwrite = 1;
        }
        if (IsRefusedScheme(source.place.text)) {
            return 0;
        }
        if (m_options.link != 0) {
            return Sys().symlinkat(source.place.text, target.place.directory, target.place.name) == 0 ? 1 : 0;
        }
        if (targetExists && IsSameFile(sourceInfo, targetInfo)) {
            return 0;
        }
        if (!from.IsOpen()) {
            from.Reset(CreateFileAt(source.place.directory, source.place.name, kSourceAccess, 0, kSourceOpenMode));
            if (!from.IsOpen() || Sys().fstat(Descriptor(from.Get()), &sourceInfo) != 0) {
                return 0;
            }
        }
        // Below the host's path a link at the target's name is not written
        // through: it may lead anywhere.
        const int targetAccess = kReadWriteCreate | O_CLOEXEC | (target.below ? O_NOFOLLOW : 0);
        OwnedHandle to(CreateFileAt(target.place.directory, target.place.name, targetAccess,
                                    overwrite != 0 ? O_TRUNC : O_EXCL, static_cast<int>(m_options.mode)));
        if (!to.IsOpen()) {
            return 0;
        }
        bool copied = CopyBytes(from.Get(), to.Get(), static_cast<int64_t>(sourceInfo.st_size));
        from.Close();
        copied = to.Close() == 1 && copied;

        if (!copied) {
            Sys().unlinkat(target.place.directory, target.place.name, 0);
            return 0;
        }
        if (m_options.move != 0 && !source.throughLink) {
            Sys().unlinkat(source.place.directory, source.place.name, 0);
        }
        return 1;
    }

    const CopyOptions m_options;
    DirectoryStack m_sources;
    DirectoryStack m_targets;
    // A deque, so that a level stays in place while deeper ones are added.
    std::deque<Level> m_levels;
    int m_total = 0;
};

}  // namespace
}  // namespace tessaline::files

int rvCopyFile(const char* source, const char* target, unsigned int recurse, unsigned int overwrite, unsigned int link,
               unsigned int move, const char* /*aux1*/, const char* /*aux2*/, unsigned long mode)
{
    if (source == nullptr || target == nullptr) {
        return 0;
    }
    const tessaline::files::CopyOptions options = {recurse, overwrite, link, move, mode};
    // The texts as rvFilename normalizes them: backslashes turned to "/".
    const rvFilename from(source, 0);
    const rvFilename to(target, 0);
    return tessaline::files::TreeCopy(options).Run(from, to);
}
