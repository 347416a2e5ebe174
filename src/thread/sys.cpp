// The real platform calls behind the thread classes' seam.
#include "thread/sys.h"

namespace tessaline::thread {

SysCalls g_sysCalls = {
    ::pthread_mutexattr_init,
    ::pthread_mutex_init,
    ::pthread_mutex_lock,
    ::pthread_mutex_trylock,
    ::pthread_mutex_unlock,
    ::pthread_condattr_init,
    ::pthread_cond_init,
    ::pthread_cond_wait,
    ::pthread_cond_timedwait,
    ::pthread_cond_signal,
    ::pthread_cond_broadcast,
    ::sem_init,
    ::sem_destroy,
    ::sem_wait,
    ::sem_trywait,
    ::sem_post,
    ::sem_getvalue,
    ::pthread_key_create,
    ::pthread_setspecific,
    ::pthread_create,
    ::pthread_join,
    ::pthread_detach,
    ::pthread_cancel,
};

}  // namespace tessaline::thread
