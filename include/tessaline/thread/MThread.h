/*
 * Thread objects over POSIX threads.
 *
 * Every class here derives from MThreadError and reports in one way: the
 * outcome of the last platform call is kept in m_lastError, a failure that
 * CHECK_SYSERROR does not consider routine is written as one line on stderr,
 * and a status code comes back to the caller. Nothing here throws, aborts or
 * exits on a failed platform call.
 *
 * Status codes:
 *    0  success
 *   -1  a platform call failed (see LastError)
 *    2  MMutex: a MutexChecked mutex is already held
 *    3  MMutex::Unlock: the tracked mutex is not held
 *   -2  MMutex::Unlock: the caller is not the holder
 *
 * Thread safety: every operation may be called from any thread once the
 * object is constructed. m_lastError is shared by all callers of an object:
 * after concurrent failures it shows whichever call wrote last, so LastError
 * is only meaningful to a thread that is the sole user at that moment.
 */
#ifndef TESSALINE_THREAD_MTHREAD_H
#define TESSALINE_THREAD_MTHREAD_H

#include <pthread.h>

#include "tessaline/util/export.h"

// Passes a thread-library result through the reporting rule: 0 gives 0;
// ENOENT, ESRCH and EAGAIN give -1 silently; any other value, negative ones
// too, writes "Thread #%d error: %s (%d)\n" to stderr and gives -1. The
// thread identifier is printed through %d, so on x86-64 the line shows the
// low 32 bits of pthread_self().
TESSALINE_API int CHECK_SYSERROR(int err);

// Base of all thread classes: the code of the last operation on the object.
class TESSALINE_API MThreadError {
public:
    MThreadError();

    // The code of the last operation: a platform result, errno for the
    // semaphore calls, or a negative code of this subsystem.
    virtual int LastError();

    // strerror(m_lastError). The text belongs to the C library and is valid
    // until the next strerror call in any thread.
    virtual char* LastErrorText();

    // Writes m_lastError without a data race when several threads report
    // through one object; the last writer wins, as documented above.
    void StoreLastError(int code);

    int m_lastError;
};

// Abstract mutex interface.
class TESSALINE_API MMutex_ : public MThreadError {
public:
    enum MutexType : int {
        MutexPlain = 0,     // straight to the platform mutex
        MutexChecked = 1,   // refuses (status 2) while held, never queues
        MutexRecursive = 2  // the holder re-enters and counts
    };

    MMutex_();

    virtual int Create(MutexType type, int* err) = 0;
    virtual int Try(int* err) = 0;
    virtual int Lock(int* err) = 0;
    virtual int Unlock(int* err) = 0;

    MutexType m_type;
    // 1 while a tracked mutex is held; written on every tracked acquisition
    // and final release. Read it through Locked().
    int m_locked;

    int Locked() const;
};

/*
 * A mutex with plain, checked and recursive modes. The checked and
 * recursive ("tracked") modes keep a record of the holder (m_count, m_owner,
 * m_held) under the inner m_guard, which is held only for short spans and
 * never while blocking on m_mutex.
 *
 * `err`, where given, receives errno just before the call returns, except
 * on a recursive re-entry and on an Unlock by a non-holder.
 *
 * Typical use:
 *   MMutex mutex(MMutex_::MutexRecursive);
 *   if (mutex.Lock(nullptr) == 0) { ...; mutex.Unlock(nullptr); }
 */
class TESSALINE_API MMutex : public MMutex_ {
public:
    explicit MMutex(MMutex_::MutexType type);

    // Initialises the attribute object, m_mutex and m_guard and clears the
    // record. Calling it again re-initialises without destroying. `err` is
    // not written.
    int Create(MMutex_::MutexType type, int* err) override;

    // Like Lock, but never blocks: a mutex held by another thread gives -1
    // with EBUSY in m_lastError (and the CHECK_SYSERROR line); a held
    // MutexChecked gives 2. Clears m_lastError first.
    int Try(int* err) override;

    // 0 once held. MutexChecked with a holder recorded: 2 at once, for the
    // holder and every other thread. MutexRecursive re-entered by its
    // holder: 0 with m_count raised, m_lastError untouched. A type outside
    // 0..2 takes nothing and reports the current m_lastError.
    int Lock(int* err) override;

    // 0 once released (a recursive holder must unlock as often as it
    // locked). Tracked mutex not held: 3. Caller not the holder: -2, the
    // lock stays. Both refusals leave -2 in m_lastError and print nothing.
    int Unlock(int* err) override;

    // Destroys the attribute object and both platform mutexes. Destroying a
    // held mutex is not detected.
    virtual ~MMutex();

    // A copy by value of the platform mutex, as the classic interface has it.
    operator pthread_mutex_t() const;

    pthread_mutexattr_t m_attr;
    pthread_mutex_t m_mutex;
    pthread_mutex_t m_guard;
    int m_count;
    unsigned long m_owner;
    int m_held;
};

#endif
