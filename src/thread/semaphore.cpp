// MSemaphore: a counting semaphore over the POSIX semaphore calls, which
// report through errno.
#include <cerrno>

#include "thread/report.h"
#include "thread/sys.h"
#include "tessaline/thread/MThread.h"

namespace tessaline::thread {
namespace {

// Below the platform's maximum on purpose: hosts rely on this limit.
constexpr long kMaxCount = 32767;

// The semaphore calls give -1 and set errno; turn that into the code.
int CodeOf(int result)
{
    return result == -1 ? errno : result;
}

}  // namespace
}  // namespace tessaline::thread

using tessaline::thread::CodeOf;
using tessaline::thread::Report;
using tessaline::thread::Sys;

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
        StoreLastError(CodeOf(Sys().sem_destroy(&m_sem)));
    }
}

int MSemaphore::Init(long count)
{
    if (m_bInitialised) {
        Sys().sem_destroy(&m_sem);
        m_bInitialised = false;
    }
    const long limited = count > tessaline::thread::kMaxCount ? tessaline::thread::kMaxCount : count;
    const int result =
        limited < 0 ? EINVAL : CodeOf(Sys().sem_init(&m_sem, m_shared, static_cast<unsigned int>(limited)));
    m_bInitialised = result == 0;
    return Report(*this, result);
}

int MSemaphore::Wait()
{
    int result = EINVAL;
    if (m_bInitialised) {
        do {
            result = CodeOf(Sys().sem_wait(&m_sem));
        } while (result == EINTR);
    }
    return Report(*this, result);
}

int MSemaphore::Try()
{
    return Report(*this, m_bInitialised ? CodeOf(Sys().sem_trywait(&m_sem)) : EINVAL);
}

int MSemaphore::Signal()
{
    return Report(*this, m_bInitialised ? CodeOf(Sys().sem_post(&m_sem)) : EINVAL);
}

long MSemaphore::Count()
{
    int value = 0;
    if (!m_bInitialised || Sys().sem_getvalue(&m_sem, &value) != 0) {
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
