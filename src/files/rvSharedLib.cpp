#include "tessaline/files/rvSharedLib.h"

#include <dlfcn.h>
#include <errno.h>
#include <string.h>

#include "files/sys.h"

using tessaline::files::Sys;

char rvSharedLib::m_defLibExt[16] = "so";
int rvSharedLib::m_disposition = RTLD_NOW | RTLD_GLOBAL;

rvSharedLib::rvSharedLib(const char* name, int flags)
    : m_error(0), m_handle(nullptr), m_name(nullptr, 0), m_flags(flags)
{
    if (name && rvSharedLib::Open(name, m_disposition, 0)) {
        m_name = name;
    }
}

rvSharedLib::~rvSharedLib()
{
    rvSharedLib::Close();
}

rvSharedLib& rvSharedLib::operator=(const rvSharedLib& other)
{
    if (this != &other) {
        Open(other.m_name(), m_disposition, 0);
    }
    return *this;
}

int rvSharedLib::Open(const char* name, int disposition, int /*extra*/)
{
    rvFilename file(m_name);
    if (name) {
        file = name;
    }
    if (!*file.Ext()) {
        file.Dup(&file.m_pExt, m_defLibExt, -1);
        file.Join(nullptr, nullptr, nullptr, nullptr, nullptr);
    }

    m_error = 0;
    m_handle = Sys().dlopen(file(), disposition);
    if (!m_handle) {
        m_error = errno;
        // The loader's message is pending until read; read it so that it
        // does not surface in the host's next dlerror.
        Sys().dlerror();
        return 0;
    }
    m_name = file;
    m_disposition = disposition;
    return 1;
}

int rvSharedLib::Close()
{
    m_error = 0;
    if (!m_handle) {
        return 0;
    }
    int result = Sys().dlclose(m_handle);
    if (result != 0) {
        m_error = errno;
    }
    m_handle = nullptr;
    return result == 0 ? 1 : 0;
}

void* rvSharedLib::ProcAddr(const char* symbol)
{
    return ResolveSymbol(symbol);
}

void* rvSharedLib::ResolveSymbol(const char* symbol)
{
    m_error = 0;
    if (!symbol) {
        m_error = EINVAL;
        return nullptr;
    }
    void* address = Sys().dlsym(m_handle, symbol);
    if (!address) {
        m_error = errno;
    }
    return address;
}

int rvSharedLib::IsValid()
{
    return m_handle ? 1 : 0;
}

int rvSharedLib::Disposition()
{
    return m_disposition;
}

void rvSharedLib::Disposition(int disposition)
{
    m_disposition = disposition;
}

rvSharedLib::operator const char*()
{
    return m_name();
}

char* rvSharedLib::DefaultExtension(const char* extension)
{
    memset(m_defLibExt, 0, sizeof m_defLibExt);
    if (extension) {
        strncpy(m_defLibExt, extension, sizeof m_defLibExt - 1);
    }
    return m_defLibExt;
}

char* rvSharedLib::DefaultExtension()
{
    return m_defLibExt;
}
