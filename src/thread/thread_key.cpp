// MThreadKey: one key of thread-specific data.
#include <cerrno>

#include "thread/report.h"
#include "thread/sys.h"
#include "tessaline/thread/MThread.h"

using tessaline::thread::Report;
using tessaline::thread::Sys;

MThreadKey_::MThreadKey_() = default;

MThreadKey::MThreadKey() : m_key(0), m_bHasKey(false) {}

MThreadKey::~MThreadKey()
{
    if (m_bHasKey) {
        pthread_key_delete(m_key);
    }
}

int MThreadKey::Create(void (*destructor)(), int, int*)
{
    if (m_bHasKey) {
        pthread_key_delete(m_key);
        m_bHasKey = false;
        m_key = 0;
    }
    // The classic signature takes an unprototyped routine; the platform calls
    // it with the thread's value.
    pthread_key_t key = 0;
    const int result = Sys().pthread_key_create(&key, reinterpret_cast<void (*)(void*)>(destructor));
    if (result == 0) {
        m_key = key;
        m_bHasKey = true;
    }
    return Report(*this, result);
}

int MThreadKey::SetValue(void* value, int* /*err*/)
{
    return Report(*this, m_bHasKey ? Sys().pthread_setspecific(m_key, value) : EINVAL);
}

void* MThreadKey::GetValue(int* /*err*/)
{
    return m_bHasKey ? pthread_getspecific(m_key) : nullptr;
}

MThreadKey::operator unsigned int() const
{
    return m_key;
}
