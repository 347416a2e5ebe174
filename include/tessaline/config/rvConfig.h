/**
 * @file
 * @brief rvConfig: a sectioned configuration file held in memory.
 */
/**
 * @class rvConfig
 * @brief A sectioned configuration file held in memory.
 *
 * The object keeps a table of sections, each a table of keys with text
 * values. Section and key names compare without regard to case; a lookup
 * searches the one section it names and nowhere else. Load reads a file into
 * the tables; Flush merges the tables back into the file so that comments
 * and layout survive, and replaces the file by renaming.
 *
 * Results: operations return 1 for success or yes and 0 for failure or no,
 * unless they say otherwise. Nothing here throws of its own; an allocation
 * failure (std::bad_alloc) passes through and leaves no lock held. The only
 * failures reported in words are the three lines Flush may write to stderr.
 *
 * Ownership: text passed in is copied (the rope overloads share it instead).
 * A `const char*` returned by the object points to text the object owns; each
 * operation says how long it stays valid.
 *
 * Thread safety: one recursive lock, m_mutex, serves all objects together.
 * Single lookups and stores, Clear, the removals, Load, Serialize and the
 * whole of Flush hold it. Section, the enumerations and the counts do not,
 * and the string GetValue stores its result after the lock has gone: a
 * caller that shares one object between threads brackets such sequences with
 * Lock() and Unlock(), inside which the locked operations may still be
 * called.
 *
 * Typical use:
 * @code
 *   rvConfig config("app.ini", rvConfig::OpenUpdate);
 *   const char* port = config.GetValue("port", "80", "net");
 *   config.PutValue("port", "8080", "net");
 *   config.Flush(0);
 * @endcode
 *
 * Names in this class follow the classic interface, including the leading
 * underscores of the raw operations (_GetValue, _PutValue).
 */
#ifndef TESSALINE_CONFIG_RVCONFIG_H
#define TESSALINE_CONFIG_RVCONFIG_H

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <strings.h>

#include <ext/rope>

#include "tessaline/config/NameTable.h"

#include "tessaline/thread/MThread.h"
#include "tessaline/export.h"

class TESSALINE_API rvConfig {
public:
    /// How Open opens the file. Any other value fails as an unopenable file.
    enum OpenMode : int {
        OpenRead = 0,   ///< "r": the file must exist
        OpenWrite = 1,  ///< "w": created or emptied at once
        OpenUpdate = 2  ///< "r+", else "w+": created empty when missing
    };

    /// One shared reference to immutable text. Copies share the text; an
    /// empty string is held as a null reference, which is what "empty" means
    /// for a section argument. Built from a `const char*`, it copies the
    /// characters; a null pointer is taken as "". Built from a rope, it
    /// shares the rope's text, and turns back into a rope that shares it too;
    /// it is not itself a rope, so its copies never take the rope's lock.
    ///
    /// The key and value type of the tables. The reference count is atomic,
    /// so copies of one text may live in different threads; a single cfgStr
    /// object is not to be written by two threads at once.
    class cfgStr {
    public:
        /// The empty text, held as a null reference.
        cfgStr() noexcept = default;
        /// Copies the characters up to the NUL; null gives "".
        cfgStr(const char* text);
        /// Copies `length` characters of `text`, which must hold that many;
        /// the text reads up to the first NUL among them.
        cfgStr(const char* text, std::size_t length);
        /// Shares the rope's text; copies no characters.
        cfgStr(const __gnu_cxx::crope& text);
        /// Shares `other`'s text.
        cfgStr(const cfgStr& other) noexcept : m_bits(other.m_bits & ~kBorrowed) { Hold(); }
        /// Shares `source`'s text without counting it: valid only while the
        /// text is held elsewhere. Tables make such references for Flush's
        /// working copy; any copy or move of one counts as usual.
        cfgStr(const cfgStr& source, tessaline::config::BorrowingCopy) noexcept
            : m_bits(source.m_bits == 0 ? 0 : source.m_bits | kBorrowed)
        {
        }
        /// Takes `other`'s text and leaves `other` empty.
        cfgStr(cfgStr&& other) noexcept : m_bits(other.m_bits)
        {
            other.m_bits = 0;
            if ((m_bits & kBorrowed) != 0) {
                m_bits &= ~kBorrowed;
                Hold();
            }
        }
        ~cfgStr()
        {
            if (m_bits != 0 && (m_bits & kBorrowed) == 0) {
                Drop(Get());
            }
        }
        /// Shares `other`'s text and drops the old one.
        cfgStr& operator=(const cfgStr& other) noexcept
        {
            cfgStr copy(other);
            copy.SwapBits(*this);
            return *this;
        }
        /// Takes `other`'s text, leaves `other` empty and drops the old one.
        cfgStr& operator=(cfgStr&& other) noexcept
        {
            cfgStr taken(std::move(other));
            taken.SwapBits(*this);
            return *this;
        }
        /// Exchanges the texts.
        void swap(cfgStr& other) noexcept
        {
            cfgStr mine(std::move(*this));
            *this = std::move(other);
            other = std::move(mine);
        }

        /// The text, NUL-terminated; "" when empty, never null. Valid while
        /// any cfgStr shares this text.
        const char* c_str() const noexcept
        {
            const Text* text = Get();
            if (text == nullptr) {
                return "";
            }
            if ((text->length & kRopeText) != 0) {
                return RopeChars(text);
            }
            return reinterpret_cast<const char*>(text + 1);
        }
        /// The length of c_str(), and whether it is 0.
        ///@{
        std::size_t size() const noexcept { return m_bits == 0 ? 0 : Get()->length & ~kRopeText; }
        std::size_t length() const noexcept { return size(); }
        bool empty() const noexcept { return m_bits == 0; }
        ///@}

        /// The text as a rope: shared when it came from a rope, else copied.
        operator __gnu_cxx::crope() const;

        /// tessaline::config::FoldedNameHash of the text, kept with the text
        /// after its first use.
        unsigned int FoldHash() const noexcept
        {
            Text* text = Get();
            if (text == nullptr) {
                return tessaline::config::FoldedNameHash("", 0);
            }
            const unsigned int fold = text->foldHash.load(std::memory_order_relaxed);
            return fold != 0 ? fold : StoreFoldHash(text);
        }

    private:
        // The shared block: this header, then the characters, or for text
        // shared with a rope a header of the library's own.
        struct Text {
            std::atomic<unsigned int> refs;
            unsigned int length;
            std::atomic<unsigned int> foldHash;
        };
        static constexpr unsigned int kRopeText = 0x80000000u;
        struct RopeText;

        // The low bit of m_bits marks a reference that does not count.
        static constexpr std::uintptr_t kBorrowed = 1;

        Text* Get() const noexcept { return reinterpret_cast<Text*>(m_bits & ~kBorrowed); }
        void Hold() const noexcept
        {
            if (m_bits != 0) {
                Get()->refs.fetch_add(1, std::memory_order_relaxed);
            }
        }
        void SwapBits(cfgStr& other) noexcept
        {
            const std::uintptr_t bits = m_bits;
            m_bits = other.m_bits;
            other.m_bits = bits;
        }
        void Adopt(Text* text) noexcept { m_bits = reinterpret_cast<std::uintptr_t>(text); }

        static void Drop(Text* text) noexcept
        {
            if (text->refs.fetch_sub(1, std::memory_order_acq_rel) == 1) {
                Free(text);
            }
        }
        static void Free(Text* text) noexcept;
        static const char* RopeChars(const Text* text) noexcept;
        static unsigned int StoreFoldHash(Text* text) noexcept;

        std::uintptr_t m_bits = 0;
    };

    /// The name hash of both table levels.
    struct rvstrhashfunction {
        /// The bytes at 1, 3, 8, 14 and 18 from the end, folded to lower
        /// case for A-Z only and read as signed chars, combined as
        /// h = h * 5 + byte, then h % 5000 (sign of h) as an unsigned 32-bit
        /// value. The 32-bit value is also the bucket arithmetic on x86-64:
        /// the table reduces it modulo its bucket count unchanged. An empty
        /// name hashes to 0; at most five bytes are read, whatever the
        /// length.
        unsigned int operator()(const cfgStr& name) const { return (*this)(name.c_str(), name.size()); }
        /// The same for the `length` characters at `text`.
        unsigned int operator()(const char* text, std::size_t length) const
        {
            constexpr std::size_t kPositions[] = {1, 3, 8, 14, 18};
            int h = 0;
            for (std::size_t k : kPositions) {
                if (length < k) {
                    break;
                }
                unsigned char byte = static_cast<unsigned char>(text[length - k]);
                if (byte >= 'A' && byte <= 'Z') {
                    byte = static_cast<unsigned char>(byte + 32);
                }
                h = h * 5 + static_cast<signed char>(byte);
            }
            return static_cast<unsigned int>(h % 5000);
        }
    };

    /// The name comparison of both table levels.
    struct eqcstr {
        /// Names are equal when strcasecmp of their texts gives 0.
        bool operator()(const cfgStr& a, const cfgStr& b) const { return strcasecmp(a.c_str(), b.c_str()) == 0; }
    };

    /// @name Tables
    /// Both levels start with 193 buckets. Their order of iteration (buckets
    /// upward, newest entry first within a bucket, chains reversed by a
    /// rehash) is the order of enumeration and of new lines in a saved file.
    /// They offer the extension hash_map's members (find, insert, erase,
    /// operator[], iteration, size, bucket_count, ...) and find a name in
    /// constant time, however many names share a bucket.
    ///@{

    /// The keys of one section: key name to value.
    typedef tessaline::config::NameTable<const cfgStr, cfgStr, rvstrhashfunction, eqcstr> KeyTable;
    /// The sections: section name to its KeyTable.
    typedef tessaline::config::NameTable<const cfgStr, KeyTable, rvstrhashfunction, eqcstr> SectionTable;
    ///@}

    /// @name Format of the file
    /// The reader tests every line through these members. They are shared by
    /// all objects and read without a lock.
    ///@{

    /// Comment starters, "#;/": a line whose first character after trimming
    /// is one of these is a comment.
    static const char* m_szCommentChars;
    /// Section brackets, "[]": they start a section line and bound its name.
    static const char* m_szSectionChars;
    /// The delimiter, "=", that ends the key of a key line.
    static const char* m_szDelimChars;
    /// The identification line, "# Edited by Tessaline", which closes every
    /// file the writer produces.
    static const char* m_szIdString;
    /// The default section, "defaults"; read anew by the constructors and by
    /// Clear.
    static const char* m_szDefaults;
    ///@}

    /// Whether a rewrite keeps the old file as a backup; 0 at load time. Read
    /// and written without a lock.
    static unsigned int m_bBackups;
    /// The class lock, recursive, made when the library is loaded. One lock
    /// for all objects; Lock() and Unlock() take and release it.
    static MMutex m_mutex;

    /// One section, the default section, current and empty. IsValid() gives
    /// 1, IsModified() 0, Mode() OpenRead, ConfigName() "".
    rvConfig();

    /// Load(path, mode), result dropped: after a failure the object has no
    /// sections, Section() is "" and IsValid() gives 0. Mode() is OpenRead
    /// and ConfigName() "" until a Load succeeds.
    rvConfig(const char* path, OpenMode mode);

    /// Close(0): nothing is saved.
    virtual ~rvConfig();

    /// Not copyable: the object owns its stream and its enumeration cursors.
    rvConfig(const rvConfig&) = delete;
    /// Not assignable, for the same reason.
    rvConfig& operator=(const rvConfig&) = delete;

    /// Opens `name` in `mode` into m_pFile, trying three times one second
    /// apart (a failure takes three seconds). On success stores the name (as
    /// ConfigName(name)) and the mode, and returns the stream, which the
    /// object owns until Close. On failure returns null, name and mode stay.
    /// A stream that is still open is closed first. A null name fails at
    /// once. The stream is close-on-exec. Reads nothing, leaves the tables
    /// alone and takes no lock.
    virtual FILE* Open(const char* name, OpenMode mode);

    /// Replaces the content of the object by the file: Open, the reading
    /// pass, Close(0), all under the class lock. 1 if the file could be
    /// opened, whatever it held; 0 if not, and then nothing has changed.
    /// No stream is left open either way.
    ///
    /// Lines are trimmed; blank lines and comments ('#', ';', '/') are
    /// skipped; "[name]" selects a section (created if new); "key = value"
    /// stores into it, the first of two values for one key winning. Keys
    /// above the first section line go to DefaultSection(). A value in
    /// double quotes keeps its blanks. A line of more than 4094 bytes is
    /// read as pieces of 4094, each a line of its own. A UTF-8 byte order
    /// mark (EF BB BF) at the very start of the file is no part of the first
    /// line (it counts toward that line's first 4094 bytes); anywhere else
    /// the three bytes are text like any other. A section line made
    /// only of brackets ("[]", as the writer writes a section with the empty
    /// name) selects the section with the empty name. Afterwards the current
    /// section is the default section, which always exists. Nothing is
    /// reported: lines that make no sense are skipped silently.
    virtual unsigned int Load(const char* name, OpenMode mode);

    /// Closes the stream if open, then Flush(0) if bFlush is nonzero and the
    /// object is modified. Always 1, whatever the flush gave. Takes no lock
    /// of its own (the flush does).
    virtual unsigned int Close(unsigned int bFlush);

    /// Writes the tables into the file if the object is modified, then
    /// empties the object if bClear is nonzero. 1 on success and when there
    /// was nothing to write, 0 if the file was not replaced as asked (bClear
    /// is then ignored and IsModified() stays 1).
    ///
    /// The old file's comments, blank lines and key lines stay where they
    /// are, with the table's values; removed keys and emptied sections go;
    /// new keys end their section and new sections come last, in table
    /// order; one identification line closes the file. The merged text goes
    /// to a temporary file beside the old one ("app.new" for "app.ini"),
    /// which then replaces it. Refuses (0, nothing touched) in OpenRead
    /// mode, without a ConfigName(), or when the file exists but is not
    /// writable or cannot be opened. It also refuses a ConfigName() of 4094
    /// characters: every longer name was cut to that length, and a cut name
    /// would send the text to another file (and replace that one). A name of
    /// exactly 4094 characters is refused for the same reason, as it cannot
    /// be told from a cut one.
    ///
    /// A file that began with a UTF-8 byte order mark begins with it again;
    /// no other file gets one (nor a new file, nor one rewritten in
    /// OpenWrite, whose old text is gone).
    ///
    /// Symbolic links: where ConfigName() is a link or a chain of links, the
    /// file at the end of the chain is replaced and the links stay links
    /// ("/etc/app.ini -> /srv/conf/app.ini" rewrites /srv/conf/app.ini). The
    /// side files stand beside that file ("/srv/conf/app.new",
    /// "/srv/conf/app.bak"), so the rename stays on its file system; a
    /// relative link counts from the directory that holds it. ConfigName()
    /// stays as given. A dangling link is a file that does not exist yet: it
    /// is created at the link's final target. Refused at once (0, nothing
    /// touched, no pause): a chain of more than 40 links (a loop), and a
    /// target whose name, or a side file's, would pass the path limit of
    /// 4095 characters. A target whose directory is not writable fails as
    /// any unwritable directory: three attempts one second apart, then 0 with
    /// the old file untouched.
    ///
    /// Guarantees (no data is lost):
    /// - A crash or a kill at any moment leaves a complete file under the
    ///   configuration's name, the old one or the new one. The temporary
    ///   file is renamed over the old file in one step; with CreateBackups(1)
    ///   the old file first gets its backup name ("app.bak") as a second hard
    ///   link, so the backup holds the file as it was before this write.
    /// - Where the file system refuses that (no hard links, or no rename over
    ///   an existing file), the old file is renamed to the backup name (or
    ///   unlinked without backups) and the temporary file renamed after it.
    ///   A crash between the two leaves no file under the name: the new text
    ///   is complete in "app.new", and with backups the old in "app.bak".
    /// - Every write to the temporary file is checked, and the file is
    ///   flushed and fsync'ed before anything is renamed. If any of that
    ///   fails (a full disk, a file size limit), the temporary file is
    ///   removed, the old file is left byte for byte, and the result is 0
    ///   without a message. The directory is synced after the temporary file
    ///   is complete and after the replacement (best effort: not every file
    ///   system can).
    /// - A read error in the old file fails the same way (0, the old file
    ///   byte for byte, the temporary file removed, IsModified() still 1):
    ///   merging only the lines before the error would lose the rest of its
    ///   comments and layout.
    /// - The temporary file is created afresh: a file or symbolic link
    ///   already at its name is removed, never written through, and one
    ///   planted meanwhile makes the attempt fail (three attempts, one second
    ///   apart, then 0 without a message).
    /// - The new file keeps the permission bits of the file it replaces (a
    ///   0600 file stays 0600); a file that did not exist gets those of a new
    ///   fopen, 0666 less the umask. It also keeps the owner and group where
    ///   the process may give them: always when it is privileged (a service's
    ///   file rewritten by root stays the service's), and the group when it
    ///   owns the file and belongs to that group. Where it may not, the new
    ///   file has the writer's owner and group, and Flush still succeeds.
    /// - Side-file names never equal the file's own name and stand in its
    ///   directory: where replacing the extension would give that name
    ///   ("app.new", "app.bak"), or where the name does not come apart as a
    ///   plain file name (it holds a backslash, which file names read as a
    ///   directory separator), the extension is appended ("app.new.new",
    ///   "app.bak.bak").
    /// - If the final rename fails with backups off, the old file is already
    ///   gone and the temporary file holds the only copy on disk: it is kept
    ///   under its name. With backups on, the old text is in the backup and
    ///   the temporary file is removed.
    /// The step-by-step replacement prints one line on stderr for each of its
    /// failures (a failed backup rename, a failed unlink, a failed final
    /// rename), with strerror(errno) and errno; the one-step replacement
    /// prints nothing, and its failure leads to the steps.
    ///
    /// Holds the class lock for its whole length, so threads may flush one
    /// shared object. Ends any enumeration; the current section is left at
    /// the last section the pass selected.
    virtual unsigned int Flush(unsigned int bClear);

    /// Empties the object: no sections (bucket counts stay), IsValid() and
    /// IsModified() 0, the default section's name back to m_szDefaults, the
    /// current section "". Name, mode, stream and the last GetValue text stay.
    /// Unlike a new object, a cleared one has not even the default section.
    /// Takes the class lock; ends any enumeration.
    virtual void Clear();

    /// Mode of the last successful Open, or what Mode(mode) set; OpenRead
    /// for a new object.
    virtual OpenMode Mode();
    /// Sets the mode Flush writes with; opens nothing.
    virtual void Mode(OpenMode mode);

    /// The file's name, "" until one is set. Valid until the name changes.
    /// The text is the object's own array, never null.
    virtual const char* ConfigName();
    /// Keeps at most the first 4094 characters of `name`; null gives "".
    /// `name` may be ConfigName() itself. Flush never writes to a name of
    /// that length, so a cut name is never written.
    virtual void ConfigName(const char* name);

    /// Makes `name` the current section if it exists (1), or creates it when
    /// `create` is nonzero (1; adds 1 to IsValid(), IsModified() unchanged).
    /// Else 0 and the current section stays. The current section keeps the
    /// spelling given here. Takes no lock.
    virtual unsigned int Section(const char* name, unsigned int create);
    /// The current section's name; valid until the current section changes.
    /// It may name a section that no longer exists (after RemoveSection);
    /// lookups then miss and a store creates it again.
    virtual const char* Section();

    /// Names the default section that the next reading pass starts in.
    /// Creates nothing and takes no lock; Clear (and so every read) restores
    /// m_szDefaults.
    virtual void DefaultSection(const char* name);
    /// The default section's name. Valid until the default section's name
    /// changes.
    virtual const char* DefaultSection();

    /// Remove one key or one whole section, names taken literally ("" is the
    /// section with the empty name). IsModified() becomes 1 even when there
    /// was nothing to remove; IsValid() does not change. A section whose last
    /// key goes stays, empty. Note the order: section first. Both take the
    /// class lock. Removing the entry an enumeration stands on ends that
    /// enumeration.
    ///@{
    virtual void RemoveKey(const char* section, const char* key);
    virtual void RemoveSection(const char* section);
    ///@}

    /// @name Values
    /// For every GetValue, GetBool, PutValue and PutBool: `section` "" (or an
    /// empty rope) is the current section; any other text names a section
    /// directly, and a lookup searches that section alone. Getters never
    /// write to the tables and never store the default.
    ///
    /// `key`, `value` and `section` must be valid pointers: null is outside
    /// the contract (only `def` of the string GetValue may be null). Each
    /// lookup and each store holds the class lock for its own length.
    ///
    /// Every setter creates the section if missing, replaces or adds the key
    /// (an existing key keeps its stored spelling), adds 1 to IsValid(), sets
    /// IsModified() to 1 and returns 1. Nothing reaches the disk before Flush.
    /// The current section does not change.
    ///@{

    /// `def` when the key is missing; else 0 for "false" and "0", 1 for
    /// "true" and "1", in any case; any other text gives `def` unchanged.
    virtual unsigned int GetBool(const char* key, unsigned int def, const char* section);
    /// Stores "True" or "False".
    virtual unsigned int PutBool(const char* key, unsigned int value, const char* section);

    /// `def` when the key is missing; else strtol base 10 of the text,
    /// clamped to the int range (2147483647, -2147483648) as on a platform
    /// with a 32-bit long. Text that is no number gives 0, not `def`.
    virtual int GetValue(const char* key, int def, const char* section);
    /// The value's text, or `def` (the caller's pointer, maybe null) when the
    /// key is missing. An empty value is a hit and gives "". The text stays
    /// valid until the next hit of this operation on this object.
    ///
    /// The result is kept in m_strValue after the class lock has gone: two
    /// threads reading through one object can overwrite each other's
    /// result, so a shared object is read inside Lock() and Unlock().
    virtual const char* GetValue(const char* key, const char* def, const char* section);
    /// `def` when the key is missing; else strtod of the text (0.0 for text
    /// that is no number), with the locale's decimal point.
    virtual double GetValue(const char* key, double def, const char* section);
    /// `out` receives the value, or `def` when the key is missing. Shares the
    /// text, copies no characters.
    virtual void GetValue(__gnu_cxx::crope& out, const __gnu_cxx::crope& key, const __gnu_cxx::crope& def,
                          const __gnu_cxx::crope& section);
    /// As above; `def` is read only on a miss and must then be valid.
    virtual void GetValue(__gnu_cxx::crope& out, const char* key, const char* def, const char* section);

    /// Stores "%d".
    virtual unsigned int PutValue(const char* key, int value, const char* section);
    /// Stores the text exactly as given, blanks included; only a later read
    /// of the file trims.
    virtual unsigned int PutValue(const char* key, const char* value, const char* section);
    /// Stores "%f" (six decimals). A value whose "%f" text would not fit
    /// the 31 characters of the classic buffer (magnitude of about 1e23 and
    /// above) is stored as "%.17g" instead, which fits and reads back as the
    /// same double.
    virtual unsigned int PutValue(const char* key, double value, const char* section);
    /// Store by reference: no characters are copied.
    virtual unsigned int PutValue(const __gnu_cxx::crope& key, const __gnu_cxx::crope& value,
                                  const __gnu_cxx::crope& section);
    /// Copies `key` and `section`, shares the text of `value`.
    virtual unsigned int PutValue(const char* key, const __gnu_cxx::crope& value, const char* section);
    ///@}

    /// 1 while there are changes that Flush has not saved.
    virtual unsigned int IsModified();
    /// Stores `flag` as given. The setters, the removals and Flush call it
    /// through the virtual table, so an override sees their changes.
    virtual void IsModified(unsigned int flag);

    /// Items stored since the last reset (sections created, stores, key
    /// lines read); never lowered by a removal. After a read it is nonzero
    /// exactly when the file gave a key or created a section.
    virtual unsigned int IsValid();

    /// Raw lookup under the class lock: 1 and the text in `*value`, or 0
    /// with `*value` untouched. An empty section means the current section;
    /// there is no fallback to any other section. Shares the text; writes
    /// nothing into the object.
    unsigned int _GetValue(cfgStr key, cfgStr* value, cfgStr section);

    /// Raw store under the class lock; always 1. An empty section means the
    /// current section. See the setters (PutValue).
    unsigned int _PutValue(cfgStr key, cfgStr value, cfgStr section);

    /// 0 runs the reading pass on the open stream and gives 0; nonzero runs
    /// the writing pass of Flush (which consumes the tables) and gives 1 or
    /// 0. Holds the class lock for the pass, as Load and Flush do around it;
    /// use those.
    unsigned int Serialize(unsigned int bWrite);

    /// Trims blanks, tabs, CR and LF from both ends in place and returns the
    /// first character left. A text made only of such characters is left as
    /// it is and the result points at its terminator. Null gives null.
    char* Clean(char* text);

    /// Section names in table order: first nonzero starts over, 0 moves on.
    /// Null at the end; moving on after that (or before any start) keeps
    /// giving null. A name stays valid until its section is removed. Clear,
    /// Load, Flush and the removal of the current entry end an enumeration:
    /// start again after them. A store that adds a section may rehash the
    /// table: the cursor stays usable, but names may then come twice or be
    /// missed. Takes no lock.
    const char* EnumSections(unsigned int first);

    /// Key names of `section` (taken literally) in table order, with one
    /// cursor per object: first nonzero, the first call, and the call after
    /// the end start over. Null at the end and for a missing section. The
    /// same rules of validity as EnumSections.
    const char* EnumTokens(const char* section, unsigned int first);

    /// Keys in `section` (taken literally), 0 if it is missing. Takes no
    /// lock.
    unsigned int TokenCnt(const char* section);
    /// Sections in the object, empty ones included. Takes no lock.
    unsigned int SectionCnt();

    /// Read and set m_bBackups for all objects, without a lock.
    ///@{
    unsigned int CreateBackups();
    void CreateBackups(unsigned int flag);
    ///@}

    /// Take and release the class lock, for sequences on a shared object.
    /// The lock is recursive: the locked operations may be called inside.
    /// While one thread holds it, the locked operations of every rvConfig
    /// object in other threads wait. Every Lock() needs its Unlock().
    ///@{
    void Lock();
    void Unlock();
    ///@}

    /// ConfigName(): valid until the name changes.
    operator const char*();

    /// Mode of the last successful Open, or what Mode(mode) set; OpenRead at
    /// construction, so that nothing is written before a mode is chosen.
    OpenMode m_mode = OpenRead;
    /// Items stored since the last reset; what IsValid() returns.
    unsigned int m_nItems = 0;
    /// 1 while there are changes that Flush has not saved.
    unsigned int m_bModified = 0;
    /// The stream between Open and Close, else null. Owned by the object.
    FILE* m_pFile = nullptr;
    /// Keeps alive the text that the last hit of the string GetValue
    /// returned.
    cfgStr m_strValue;
    /// 1 when the next EnumTokens starts from the first key.
    unsigned int m_bTokenStart = 1;
    /// @name Enumeration cursors
    /// Cursors of the enumerations: at the end of m_sections, and on no
    /// table at all, at construction.
    ///@{

    /// Cursor of EnumSections.
    SectionTable::iterator m_itSection;
    /// Cursor of EnumTokens.
    KeyTable::iterator m_itToken;
    ///@}
    /// The configuration file's name, NUL-terminated, at most 4094
    /// characters; a longer name is kept cut, and never written by Flush.
    char m_szConfigName[4096] = {};
    /// Name of the default section.
    cfgStr m_strDefaultSection{m_szDefaults};
    /// Name of the current section, in the spelling last given to Section.
    cfgStr m_strSection;
    /// The sections.
    SectionTable m_sections;
};

#endif
