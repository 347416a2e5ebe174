// MSemaphore: a counting semaphore over the POSIX semaphore calls, which
// report through errno.
#include <cerrno>

#include "tessaline/thread/MThread.h"

namespace {

// Below the platform's maximum on purpose: hosts rely on this limit.
constexpr long kMaxCount = 32767;

// The semaphore calls give -1 and set errno; turn that into the code.
int codeOf(int result)
{
    return result == -1 ? errno : result;
}

}  // namespace

MSemaphore_::MSemaphore_() = default;

long MSemaphore_::Count()
{
    return -1;
}

MSemaphore::MSemaphore(long count, int shared) noexcept : m_shared(shared), m_sem(), m_bInitialised(false)
{
    if (count > 0) {
        Init(count);
    }
}

MSemaphore::~MSemaphore()
{
    if (m_bInitialised) {
        StoreLastError(codeOf(sem_destroy(&m_sem)));
    }
}

int MSemaphore::Init(long count)
{
    if (m_bInitialised) {
        sem_destroy(&m_sem);
        m_bInitialised = false;
    }
    const long limited = count > kMaxCount ? kMaxCount : count;
    int result = 0;
    if (limited < 0) {
        result = EINVAL;
    } else {
        result = codeOf(sem_init(&m_sem, m_shared, static_cast<unsigned int>(limited)));
    }
    m_bInitialised = result == 0;
    StoreLastError(result);
    return CHECK_SYSERROR(result);
}

int MSemaphore::Wait()
{
    int result = EINVAL;
    if (m_bInitialised) {
        do {
            result = codeOf(sem_wait(&m_sem));
        } while (result == EINTR);
    }
    StoreLastError(result);
    return CHECK_SYSERROR(result);
}

int MSemaphore::Try()
{
    const int result = m_bInitialised ? codeOf(sem_trywait(&m_sem)) : EINVAL;
    StoreLastError(result);
    return CHECK_SYSERROR(result);
}

int MSemaphore::Signal()
{
    const int result = m_bInitialised ? codeOf(sem_post(&m_sem)) : EINVAL;
    StoreLastError(result);
    return CHECK_SYSERROR(result);
}

long MSemaphore::Count()
{
    int value = 0;
    if (!m_bInitialised || sem_getvalue(&m_sem, &value) != 0) {
        return -1;
    }
    return value;
}

MSemaphore::operator sem_t() const
{
    return m_sem;
}

void MSemaphore::Cleanup(void* sem)
{
    sem_post(static_cast<sem_t*>(sem));
}
