// Scoped hold of rvConfig's class lock: released on every way out of the
// scope, exceptions included.
#ifndef TESSALINE_SRC_CONFIG_CLASS_LOCK_H
#define TESSALINE_SRC_CONFIG_CLASS_LOCK_H

#include "tessaline/config/rvConfig.h"

namespace tessaline::config {

class ScopedClassLock {
public:
    ScopedClassLock() { rvConfig::m_mutex.Lock(nullptr); }
    ~ScopedClassLock() { rvConfig::m_mutex.Unlock(nullptr); }
    ScopedClassLock(const ScopedClassLock&) = delete;
    ScopedClassLock& operator=(const ScopedClassLock&) = delete;
};

}  // namespace tessaline::config

#endif
