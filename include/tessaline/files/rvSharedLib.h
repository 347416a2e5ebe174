/**
 * @file
 * @brief rvSharedLib: shared objects opened with the dynamic loader.
 */
/**
 * @class rvSharedLib
 * @brief A handle to one shared object opened with the dynamic loader.
 *
 * Over the bare loader it adds a default extension for names that have none
 * ("so" unless changed with DefaultExtension) and a class-wide open mode,
 * the disposition, that every successful Open sets. There is no search path
 * of its own: the name goes to dlopen as it stands, with its extension.
 *
 * Ownership: each object owns one loader reference and drops it in Close and
 * in the destructor. Open on an object that already holds a handle does not
 * close the old one: that library stays loaded for the life of the process.
 * Failures come back as return values with errno kept in m_error; the
 * loader's message (dlerror) is discarded and nothing is printed.
 *
 * Thread safety: m_defLibExt and m_disposition are plain statics, and a
 * successful Open writes m_disposition; hosts that open libraries on several
 * threads need a lock of their own. One object must not be used from two
 * threads at once.
 *
 * Typical use:
 * @code
 *     rvSharedLib lib("/opt/app/libplugin", 0);   // opens libplugin.so
 *     if (lib.IsValid())
 *         auto entry = reinterpret_cast<int (*)()>(lib.ProcAddr("entry"));
 * @endcode
 */
#ifndef TESSALINE_FILES_RVSHAREDLIB_H
#define TESSALINE_FILES_RVSHAREDLIB_H

#include "tessaline/files/rvFilename.h"
#include "tessaline/export.h"

class TESSALINE_API rvSharedLib {
public:
    /// Opens `name` with m_disposition unless it is null. On success the
    /// object shows the caller's text, without the added extension; after a
    /// failure it has no name. `flags` is stored and not read. The open in
    /// the constructor is this class's own, not a subclass override.
    rvSharedLib(const char* name = nullptr, int flags = 0);

    /// Only assignment is defined: it opens the library again.
    rvSharedLib(const rvSharedLib&) = delete;

    /// Close, then the name goes.
    virtual ~rvSharedLib();

    /// Open(other's name, m_disposition, 0); check IsValid for the outcome.
    /// A handle held before stays loaded and is dropped, as with Open; each
    /// object then holds its own reference. Self-assignment does nothing.
    /// An object without a name opens ".so".
    virtual rvSharedLib& operator=(const rvSharedLib& other);

    /// dlopen of `name` (null: the stored name again) with `disposition`,
    /// after adding "." and the default extension when the name has none
    /// ("libx" opens "libx.so"; "libx.so.2" and "libx.bin" go unchanged). On
    /// success the name is stored with its extension and `disposition`
    /// becomes the class-wide m_disposition. Returns 1 on success; 0 with
    /// errno in m_error otherwise, the handle then null. `extra` is unused.
    virtual int Open(const char* name, int disposition, int extra);

    /// dlclose of the handle, which becomes null either way. Returns 1 when a
    /// handle was closed; 0 when none was open (m_error 0) or dlclose failed
    /// (m_error errno). The name stays, so Open(nullptr, ...) reopens.
    virtual int Close();

    /// ResolveSymbol through the virtual table.
    virtual void* ProcAddr(const char* symbol);

    /// dlsym. Null with errno in m_error when the symbol is missing; a symbol
    /// whose value is null looks the same. On a closed object the null handle
    /// reaches dlsym, where glibc reads it as RTLD_DEFAULT and searches the
    /// global scope. A null `symbol` gives null with m_error EINVAL.
    virtual void* ResolveSymbol(const char* symbol);

    /// 1 while a library is open (the handle is not null), else 0.
    virtual int IsValid();

    /// The class-wide open mode used by the constructor and assignment:
    /// read, or set for every object of the class (m_disposition).
    ///@{
    virtual int Disposition();
    virtual void Disposition(int disposition);
    ///@}

    /// The stored name, "" when there is none; valid until the next Open.
    virtual operator const char*();

    /// Copies at most 15 characters of `extension` (no dot) into m_defLibExt,
    /// zero-filling the rest; null clears it. Returns m_defLibExt.
    static char* DefaultExtension(const char* extension);
    /// The default extension, m_defLibExt, without its dot.
    static char* DefaultExtension();

    /// The default extension without its dot, "so" at first.
    static char m_defLibExt[16];
    /// The dlopen mode of constructors and assignment, at first
    /// RTLD_NOW | RTLD_GLOBAL (0x102).
    static int m_disposition;

    /// Cleared by Open, Close and ResolveSymbol; errno when their loader call
    /// fails.
    int m_error;
    /// The loader's handle; null while nothing is open.
    void* m_handle;
    /// The name the last successful Open used, extension included; the
    /// constructor's open stores the caller's text instead.
    rvFilename m_name;
    /// The constructor's `flags`, stored and not read.
    int m_flags;
};

#endif
