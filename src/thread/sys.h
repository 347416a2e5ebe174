// The platform calls of the thread classes whose failures they report,
// routed through one table so that tests can make any of them fail, or
// return at once instead of waiting. The library reads the table on every
// call; a test swaps entries under a testing::ScopedSysCalls
// (tests/support/scoped_sys_calls.h). Not part of the installed interface.
//
// Each entry returns what the platform call returns and, for the semaphore
// calls, leaves errno as that call left it.
#ifndef TESSALINE_SRC_THREAD_SYS_H
#define TESSALINE_SRC_THREAD_SYS_H

#include <pthread.h>
#include <semaphore.h>
#include <time.h>

namespace tessaline::thread {

struct SysCalls {
    int (*pthread_mutexattr_init)(pthread_mutexattr_t* attr);
    int (*pthread_mutex_init)(pthread_mutex_t* mutex, const pthread_mutexattr_t* attr);
    int (*pthread_mutex_lock)(pthread_mutex_t* mutex);
    int (*pthread_mutex_trylock)(pthread_mutex_t* mutex);
    int (*pthread_mutex_unlock)(pthread_mutex_t* mutex);
    int (*pthread_condattr_init)(pthread_condattr_t* attr);
    int (*pthread_cond_init)(pthread_cond_t* cond, const pthread_condattr_t* attr);
    int (*pthread_cond_wait)(pthread_cond_t* cond, pthread_mutex_t* mutex);
    int (*pthread_cond_timedwait)(pthread_cond_t* cond, pthread_mutex_t* mutex, const struct timespec* deadline);
    int (*pthread_cond_signal)(pthread_cond_t* cond);
    int (*pthread_cond_broadcast)(pthread_cond_t* cond);
    int (*sem_init)(sem_t* sem, int shared, unsigned int count);
    int (*sem_destroy)(sem_t* sem);
    int (*sem_wait)(sem_t* sem);
    int (*sem_trywait)(sem_t* sem);
    int (*sem_post)(sem_t* sem);
    int (*sem_getvalue)(sem_t* sem, int* value);
    int (*pthread_key_create)(pthread_key_t* key, void (*destructor)(void*));
    int (*pthread_setspecific)(pthread_key_t key, const void* value);
    int (*pthread_create)(pthread_t* thread, const pthread_attr_t* attr, void* (*routine)(void*), void* arg);
    int (*pthread_join)(pthread_t thread, void** result);
    int (*pthread_detach)(pthread_t thread);
    int (*pthread_cancel)(pthread_t thread);
};

// Defined in sys.cpp and constant-initialised, so the table is complete
// before any load-time object of the library is built.
// Hidden, so the library reads it without a detour through the GOT.
extern SysCalls g_sysCalls __attribute__((visibility("hidden")));

// The live table. Inline: the plain mutex's lock and unlock read it on every
// call. Tests reach it by linking the library's objects statically; the
// shared object does not export it.
inline SysCalls& Sys()
{
    return g_sysCalls;
}

}  // namespace tessaline::thread

#endif
