/// @file
/// @brief rvDirIterator: the entries of one directory that match a pattern.

/// @class rvDirIterator
/// @brief A forward iterator over the entries of one directory that match a
/// name pattern.
///
/// rvDirIterator walks the entries of one directory that match a name
/// pattern, as a forward iterator whose end is a default-constructed one. One
/// text names both the place and the pattern: "/var/log/*.txt" walks /var/log
/// for *.txt, "/var/log" and "/var/log/" walk all of it. A text without a
/// directory part ("*.txt") opens nothing and is at its end at once: write
/// "./*.txt" for the current directory.
///
/// Matching is fnmatch with FNM_PATHNAME only: it is case-sensitive, "?" and
/// [...] work as the platform defines them, and "*" also matches names that
/// begin with a dot, so "." and ".." are delivered and callers skip them.
/// Entries come in the platform's order, each once per walk.
///
/// Copies share one representation: one open directory, one position and one
/// entry buffer. Advancing any copy moves them all and rewrites the text that
/// operator* of every copy returns. The directory closes when the last copy
/// lets go, or when a copy reaches the end and no other holds it.
///
/// Thread safety: the reference count is a plain integer and the position is
/// shared, so an iterator and its copies must stay on one thread. Separate
/// iterators are independent.
///
/// Typical use:
/// @code
///   for (rvDirIterator it("/var/log/syslog*"); it != rvDirIterator(); ++it) {
///       const char* name = *it;  // bare entry name, valid until the next ++
///   }
/// @endcode
#ifndef TESSALINE_FILES_RVDIRITERATOR_H
#define TESSALINE_FILES_RVDIRITERATOR_H

#include <dirent.h>

#include "tessaline/files/rvFilename.h"
#include "tessaline/export.h"

/// The shared state of a walk. Hosts normally meet it only through
/// rvDirIterator.
class TESSALINE_API rvDirIterator_rep {
public:
    /// Splits `path` into the directory to open and the pattern, opens the
    /// directory and sizes the entry buffer from pathconf. A directory that
    /// cannot be opened leaves m_dir and m_entry null and the walk empty.
    explicit rvDirIterator_rep(const char* path);
    /// Closes the directory and frees the entry buffer.
    ~rvDirIterator_rep();

    /// One walk has one owner count; it can't be copied.
    ///@{
    rvDirIterator_rep(const rvDirIterator_rep&) = delete;
    rvDirIterator_rep& operator=(const rvDirIterator_rep&) = delete;
    ///@}

    /// 1 when m_entry holds the next matching entry, 0 at the end of the walk
    /// or after a read error, whose code then stays in m_error and errno.
    int get_next();

    int m_error;  ///< 0 at a clean end, else the read error.
    DIR* m_dir;   ///< Null if opening failed.
    int m_refs;   ///< Iterators that share this walk.
    /// The one entry buffer of all copies. On 32-bit x86 the library reads
    /// entries with 64-bit offsets (dirent64's layout): a host built without
    /// _FILE_OFFSET_BITS=64 reads names through operator*, not through here.
    dirent* m_entry;
    rvFilename m_pattern;  ///< Its text is the pattern alone.
};

class TESSALINE_API rvDirIterator {
public:
    /// The end iterator.
    rvDirIterator();

    /// Stands on the first entry of `path` that matches, or is the end
    /// iterator when there is none, the directory cannot be opened or `path`
    /// is null.
    explicit rvDirIterator(const char* path);

    /// Shares `other`'s walk and position.
    rvDirIterator(const rvDirIterator& other);
    /// Lets go of the walk; the last copy closes the directory.
    ~rvDirIterator();

    /// Shares `other`'s walk; self-assignment is safe.
    rvDirIterator& operator=(const rvDirIterator& other);

    /// Moves to the next matching entry, or makes this copy the end iterator.
    /// On an end iterator it does nothing.
    rvDirIterator& operator++();

    /// Advances and returns a copy taken before; the copy shares the walk, so
    /// it reads the new entry too.
    rvDirIterator operator++(int);

    /// 1 when both are end iterators or both stand on the very same entry
    /// buffer of one walk; names are not compared as text, so two walks of one
    /// directory never compare equal.
    int operator==(const rvDirIterator& other) const;
    /// The negation of operator==.
    int operator!=(const rvDirIterator& other) const { return !(*this == other); }

    /// The bare name of the current entry, without its directory. It stays
    /// valid until any copy advances or the walk is let go. Null on an end
    /// iterator.
    const char* operator*() const;

private:
    rvDirIterator_rep* m_rep;  // null marks the end iterator
    const char* m_name;        // points into m_rep->m_entry
};

#endif
