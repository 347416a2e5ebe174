// MMutex: a platform mutex plus a holder record for the checked and
// recursive modes.
#include <cerrno>

#include "thread/guard_lock.h"
#include "thread/mutex_record.h"
#include "thread/relaxed.h"
#include "thread/report.h"
#include "thread/sys.h"
#include "tessaline/thread/MThread.h"

namespace tessaline::thread {
namespace {

// The refusals leave this code in m_lastError.
constexpr int kRefused = -2;
constexpr int kCheckedHeld = 2;
constexpr int kNotHeld = 3;

void StoreErrno(int* err)
{
    if (err != nullptr) {
        *err = errno;
    }
}

// The tail of Lock, Try and Unlock.
int Finish(int result, int* err)
{
    StoreErrno(err);
    return result == 0 ? 0 : CHECK_SYSERROR(result);
}

// Lock and Try of the recursive type: the holder re-enters and counts;
// anyone else goes to m_mutex, where the record is free by the time it
// succeeds.
int LockRecursive(MMutex& mutex, HolderLock& holder, int* err, bool blocking) TESSALINE_TRY_ACQUIRE(0, holder)
{
    const unsigned long self = pthread_self();
    if (IsHeldBy(mutex, self)) {
        holder.AssertHeld();
        holder.SetCount(holder.Record().count + 1);
        return 0;
    }
    int result = 0;
    if (!holder.Acquire(blocking, result)) {
        return Finish(Keep(mutex, result), err);
    }
    holder.SetRecord(MutexRecord{self, 1, 1});
    return Finish(Keep(mutex, 0), err);
}

// Lock and Try of the checked type. A free mutex is taken with trylock in the
// same look that finds the record free, so the uncontended case costs one
// guard round; trylock never blocks, so the lock order holds. Only when
// m_mutex is taken does a Lock leave the guard and block on it.
int LockChecked(MMutex& mutex, HolderLock& holder, int* err, bool blocking) TESSALINE_TRY_ACQUIRE(0, holder)
{
    const unsigned long self = pthread_self();
    RecordGuard guard(mutex);
    int result = 0;
    {
        GuardLock lock(guard);
        if (guard.Held()) {
            mutex.StoreLastError(kRefused);
            StoreErrno(err);
            return kCheckedHeld;
        }
        if (holder.Acquire(false, result)) {
            holder.SetRecord(MutexRecord{self, 1, 1});
            return Finish(Keep(mutex, 0), err);
        }
    }
    if (!blocking) {
        return Finish(Keep(mutex, result), err);
    }
    if (!holder.Acquire(true, result)) {
        return Finish(Keep(mutex, result), err);
    }
    holder.SetRecord(MutexRecord{self, 1, 1});
    return Finish(Keep(mutex, 0), err);
}

// Out of line, like the other paths below, so that the public functions
// reach them by a jump and keep the plain hot path without a frame.
__attribute__((noinline)) int LockTracked(MMutex& mutex, int* err, bool blocking)
{
    HolderLock holder(mutex);
    return mutex.m_type == MMutex_::MutexRecursive ? LockRecursive(mutex, holder, err, blocking)
                                                   : LockChecked(mutex, holder, err, blocking);
}

// The holder's last Unlock: the record goes free before m_mutex does.
int ReleaseLast(HolderLock& holder) TESSALINE_RELEASE(holder)
{
    holder.SetRecord(MutexRecord{0, 0, 0});
    return holder.Release();
}

// Unlock by the holder, who may have entered more than once.
int UnlockAsHolder(MMutex& mutex, int* err)
{
    HolderLock holder(mutex);
    holder.AssertHeld();
    const int count = holder.Record().count - 1;
    if (count > 0) {
        holder.SetCount(count);
        return Finish(Keep(mutex, 0), err);
    }
    return Finish(Keep(mutex, ReleaseLast(holder)), err);
}

// Unlock by a thread that is not the holder: 3 when nobody holds the mutex,
// -2 when someone else does, who stays the holder.
int RefuseUnlock(MMutex& mutex, int* err)
{
    RecordGuard guard(mutex);
    GuardLock lock(guard);
    mutex.StoreLastError(kRefused);
    if (!guard.Held()) {
        StoreErrno(err);
        return kNotHeld;
    }
    return kRefused;
}

// Lock and Unlock of a plain mutex with `err`, or of a type outside the
// enumeration, which takes nothing and reports the current m_lastError.
__attribute__((noinline)) int LockUntracked(MMutex& mutex, int* err)
{
    if (mutex.m_type == MMutex_::MutexPlain) {
        return Finish(Keep(mutex, Sys().pthread_mutex_lock(&mutex.m_mutex)), err);
    }
    return Finish(LoadRelaxed(mutex.m_lastError), err);
}

__attribute__((noinline)) int UnlockUntracked(MMutex& mutex, int* err)
{
    if (mutex.m_type == MMutex_::MutexPlain) {
        return Finish(Keep(mutex, Sys().pthread_mutex_unlock(&mutex.m_mutex)), err);
    }
    return Finish(LoadRelaxed(mutex.m_lastError), err);
}

__attribute__((noinline)) int UnlockTracked(MMutex& mutex, int* err)
{
    if (IsHeldBy(mutex, pthread_self())) {
        return UnlockAsHolder(mutex, err);
    }
    return RefuseUnlock(mutex, err);
}

}  // namespace
}  // namespace tessaline::thread

using tessaline::thread::Finish;
using tessaline::thread::Keep;
using tessaline::thread::LoadRelaxed;
using tessaline::thread::Report;
using tessaline::thread::Sys;

MMutex_::MMutex_() : m_type(MutexPlain), m_locked(0) {}

int MMutex_::Locked() const
{
    return LoadRelaxed(m_locked);
}

MMutex::MMutex(MMutex_::MutexType type) : m_attr(), m_mutex(), m_guard(), m_count(0), m_owner(0), m_held(0)
{
    Create(type, nullptr);
}

MMutex::~MMutex()
{
    pthread_mutexattr_destroy(&m_attr);
    pthread_mutex_destroy(&m_mutex);
    pthread_mutex_destroy(&m_guard);
}

int MMutex::Create(MMutex_::MutexType type, int* /*err*/)
{
    StoreLastError(0);
    m_type = type;
    Report(*this, Sys().pthread_mutexattr_init(&m_attr));
    Report(*this, Sys().pthread_mutex_init(&m_mutex, &m_attr));
    // The last result is reported twice: as it comes, and as the status.
    const int result = Sys().pthread_mutex_init(&m_guard, nullptr);
    Report(*this, result);
    m_count = 0;
    m_owner = 0;
    m_held = 0;
    return CHECK_SYSERROR(result);
}

MMutex::operator pthread_mutex_t() const
{
    return m_mutex;
}

// Lock and Unlock of a plain mutex without `err` are the hot path: one
// platform call and the store of its result, with nothing live across the
// call but the object. The store is what costs against a bare platform
// call: it keeps the call from being a tail call, and the extra frame, not
// the work, is most of the difference.
int MMutex::Lock(int* err)
{
    if (m_type == MutexPlain && err == nullptr) {
        const int result = Keep(*this, Sys().pthread_mutex_lock(&m_mutex));
        return result == 0 ? 0 : CHECK_SYSERROR(result);
    }
    if (tessaline::thread::IsTracked(*this)) {
        return tessaline::thread::LockTracked(*this, err, true);
    }
    return tessaline::thread::LockUntracked(*this, err);
}

int MMutex::Try(int* err)
{
    Keep(*this, 0);
    if (m_type == MutexPlain) {
        return Finish(Keep(*this, Sys().pthread_mutex_trylock(&m_mutex)), err);
    }
    if (tessaline::thread::IsTracked(*this)) {
        return tessaline::thread::LockTracked(*this, err, false);
    }
    return Finish(0, err);
}

int MMutex::Unlock(int* err)
{
    if (m_type == MutexPlain && err == nullptr) {
        const int result = Keep(*this, Sys().pthread_mutex_unlock(&m_mutex));
        return result == 0 ? 0 : CHECK_SYSERROR(result);
    }
    if (tessaline::thread::IsTracked(*this)) {
        return tessaline::thread::UnlockTracked(*this, err);
    }
    return tessaline::thread::UnlockUntracked(*this, err);
}
