/**
 * @file
 * @brief rvFilename: names of files, directories and URLs, taken apart and
 * joined.
 */
/**
 * @class rvFilename
 * @brief One name of a file, a directory or a remote resource.
 *
 * The object keeps the whole text and, beside it, the same text taken apart
 * into scheme, server, directory, file and extension; it can also put a name
 * together from those components. It accepts plain paths, paths with
 * wildcards, //server/... names and URLs with "://". Taking a name apart is
 * pure text work except at one point: a local name without "*" that names an
 * existing directory is taken whole as the directory, which asks the file
 * system (stat) unless the object is remote.
 *
 * Ownership: every text field is an array owned by the object. A
 * `const char*` returned by an accessor points into the object and never is
 * null (an absent component reads as ""). Component pointers stay valid until
 * that component changes; pointers from operator(), operator const char*,
 * URL, Pathname, Filename, LocalPath and Join stay valid until the object's
 * text changes (assignment, Split with text, Join or any setter).
 *
 * Thread safety: no locks and no mutable statics. Separate objects are
 * independent; one object must not be used from two threads at once.
 *
 * Typical use:
 * @code
 *     rvFilename name("http://host/dir/page.html");
 *     name.Server();     // "host"
 *     name.Ext("txt");   // rewrites the text: "http://host/dir/page.txt"
 * @endcode
 */
#ifndef TESSALINE_FILES_RVFILENAME_H
#define TESSALINE_FILES_RVFILENAME_H

#include <ext/rope>

#include "tessaline/export.h"

class TESSALINE_API rvFilename {
public:
    /// The shared, immutable text of the rope overloads of the translators.
    typedef __gnu_cxx::rope<char> rope;

    /// Sets every component to null and m_remote to `remote`; a non-null
    /// `text` is copied and split. A non-zero `remote` keeps the split from
    /// asking the file system.
    rvFilename(const char* text = nullptr, unsigned int remote = 0);

    /// Takes `other`'s text and splits it anew (the file system is asked
    /// again); `other`'s m_remote does not travel.
    rvFilename(const rvFilename& other);

    /// Assignment from `other`'s text, as operator=(const char*) below.
    rvFilename& operator=(const rvFilename& other);

    /// Assignment from text. Nothing happens when `text` is the object's own
    /// text pointer or equals the held text apart from letter case (the old
    /// case and components stay). Otherwise every component is cleared, the
    /// text copied and split. A null `text` leaves the object without text.
    /// `text` may point into the object itself. m_remote is never reset.
    rvFilename& operator=(const char* text);

    /// Releases every text field.
    virtual ~rvFilename();

    /// Takes a text apart. A non-null `text` is assigned as by operator=.
    /// Null takes the object's own text apart again: a split stores only the
    /// components it finds and leaves the others as they were. A split of no
    /// text or of "" does nothing. Only the first 4094 characters take part;
    /// backslashes in the text become "/" afterwards.
    virtual void Split(const char* text);

    /// Builds the text from components: scheme (a missing "://" is added),
    /// "//" and server unless the text already holds "://", directory and "/"
    /// unless it ends in a slash, file, "." and extension. Null or empty
    /// arguments are skipped. No separator goes between server and directory.
    /// The new text is then split and its backslashes turned into "/".
    /// Returns the new text. With five null arguments the stored components
    /// are joined again; when they are all null too, nothing changes and ""
    /// comes back. Arguments may point into the object itself.
    virtual const char* Join(const char* scheme, const char* server, const char* directory, const char* file,
                             const char* ext);

    /// Parts of the text found by rebuilding the wanted components and
    /// searching the text for them: a pointer to the first occurrence, which
    /// runs to the end of the text, or "" when there is none. URL joins the
    /// scheme ("file" when absent), server, directory, file and extension;
    /// Pathname the directory, file and extension; Filename file and
    /// extension; LocalPath is Pathname. So a name without a scheme has URL
    /// "", and an object with nothing to rebuild returns its whole text. An
    /// object without text returns "".
    ///@{
    virtual const char* URL();
    virtual const char* Pathname();
    virtual const char* Filename();
    virtual const char* LocalPath();
    ///@}

    /// The components, "" when absent. FullDirectory is never stored by this
    /// class and reads "" unless a subclass fills m_pFullDirectory.
    ///@{
    virtual const char* Scheme();
    virtual const char* Server();
    virtual const char* FullDirectory();
    virtual const char* Directory();
    virtual const char* File();
    virtual const char* Ext();
    ///@}

    /// Setters: replace one component by a copy of `text` (null removes it),
    /// then Join(0, 0, 0, 0, 0) rewrites the text; its result is returned.
    /// `text` may be the very component it replaces. Removing the only
    /// component leaves the text as it was and returns "".
    ///@{
    virtual const char* Scheme(const char* text);
    virtual const char* Server(const char* text);
    virtual const char* Directory(const char* text);
    virtual const char* File(const char* text);
    virtual const char* Ext(const char* text);
    ///@}

    /// IsDirectory(m_pPath); 0 for an object without text.
    virtual int IsDirectory();

    /// 1 when both scheme and server are present, whatever m_remote says:
    /// file://x/y and //host/x answer 0.
    virtual int IsURL();

    /// 1 when `text` is empty. Null stands for the object's text, and an
    /// object without text is empty.
    virtual int Empty(const char* text);

    /// 1 when access(text, mode) succeeds; 0 for an object without text. The
    /// cause of a failure stays in errno.
    virtual int Exists(int mode);

    /// Releases every component but the text; m_pPath and m_remote stay.
    void Clear();

    /// A copy of `text` in a block of (length + 4) bytes with the low two bits
    /// cleared, zero-filled behind the text, its last byte NUL. `length` is a
    /// capacity, not a cut: a longer text fills the block but its last byte.
    /// A negative `length` stands for the length of `text`; null gives null.
    /// Release with delete[].
    char* Dup(const char* text, int length);

    /// Stores Dup(text, length) in *field and releases what *field held
    /// afterwards, so `text` may point into *field. Returns the new block.
    char* Dup(char** field, const char* text, int length);

    /// The text, "" when there is none.
    ///@{
    const char* operator()() const;
    operator const char*() const;
    ///@}

    /// Case-insensitive equality of the texts; two objects without text are
    /// equal, one without text equals nothing else.
    int operator==(const rvFilename& other) const;

    /// Case-insensitive and descending: 1 when this text sorts after
    /// `other`'s ("b" < "a"). An object without text is less than another
    /// without text and than nothing else.
    int operator<(const rvFilename& other) const;

    /// Slash translators, all in place and returning their argument. The
    /// text forms stop after 4095 characters and accept null. XlatPathToDOS
    /// keeps "://" and the slashes right behind it; the rope form of it
    /// changes every "/". The rope forms run over the whole rope.
    ///@{
    static char* XlatPathToUNIX(char* path);
    static char* XlatPathToDOS(char* path);
    static char* NormalizePath(char* path);
    static rope& XlatPathToUNIX(rope& path);
    static rope& XlatPathToDOS(rope& path);
    static rope& NormalizePath(rope& path);
    ///@}

    /// 1 when stat(path) succeeds and st_mode has the directory bit 040000.
    /// The test is that single bit, so block devices and sockets also answer
    /// 1. stat follows symbolic links. A path that fails stat is tried again
    /// without each trailing slash or backslash in turn (then cut to 4094
    /// characters). Null or "" give 0.
    static int IsDirectory(const char* path);

    /// 1 when access(path, mode) succeeds, else 0 with the cause in errno.
    /// Null gives 0.
    static int Exists(const char* path, int mode);

    /// Points at "" and is what accessors return for an absent component.
    static const char* const m_pNullStr;

    // Text fields: owned, made by Dup, released with delete[], null when
    // absent. The accessors read null as "".
    char* m_pPath;           ///< The whole text; backslashes become "/" at each split.
    char* m_pScheme;         ///< The text before "://".
    char* m_pServer;         ///< The server of a //server/... or scheme://server/... name.
    char* m_pDirectory;      ///< The directory, without a trailing "/" unless it is "/".
    char* m_pFullDirectory;  ///< Never stored by this class; for subclasses.
    char* m_pFile;           ///< The last name without its extension.
    char* m_pExt;            ///< The extension, without its dot.

    /// Non-zero: the name is not local and a split must not ask the file
    /// system. A split sets it for schemes beginning with "ftp" or "http".
    unsigned int m_remote;
};

#endif
