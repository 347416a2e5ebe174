// rvConfig's class lock as clang's thread-safety analysis sees it, and its
// scoped hold. The public MMutex carries no annotations, so the analysis
// tracks a stand-in: every hold of the class lock inside the library is a
// ScopedClassLock, and a function that must run under the lock says
// TESSALINE_REQUIRES(g_classLock).
#ifndef TESSALINE_SRC_CONFIG_CLASS_LOCK_H
#define TESSALINE_SRC_CONFIG_CLASS_LOCK_H

#include "tessaline/config/rvConfig.h"
#include "util/thread_annotations.h"

namespace tessaline::config {

// Stands for rvConfig::m_mutex; it has no state of its own.
class TESSALINE_CAPABILITY("mutex") ClassLock {
public:
    void Lock() TESSALINE_ACQUIRE() { rvConfig::m_mutex.Lock(nullptr); }
    void Unlock() TESSALINE_RELEASE() { rvConfig::m_mutex.Unlock(nullptr); }
};

inline ClassLock g_classLock;

// Holds the class lock for one scope, released on every way out of it,
// exceptions included. The lock is recursive: a function that holds it may
// call public operations that take it again.
class TESSALINE_SCOPED_CAPABILITY ScopedClassLock {
public:
    ScopedClassLock() TESSALINE_ACQUIRE(g_classLock) { g_classLock.Lock(); }
    ~ScopedClassLock() TESSALINE_RELEASE() { g_classLock.Unlock(); }
    ScopedClassLock(const ScopedClassLock&) = delete;
    ScopedClassLock& operator=(const ScopedClassLock&) = delete;
};

}  // namespace tessaline::config

#endif
