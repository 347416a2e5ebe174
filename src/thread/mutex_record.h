// The holder record of the checked and recursive mutex types, shared by
// MMutex and by MCondVar, which saves and restores it around a wait.
#ifndef TESSALINE_SRC_THREAD_MUTEX_RECORD_H
#define TESSALINE_SRC_THREAD_MUTEX_RECORD_H

#include "tessaline/thread/MThread.h"

namespace tessaline {

struct MutexRecord {
    unsigned long owner;
    int count;
    int held;
};

// Checked and recursive mutexes keep the record; plain ones don't.
inline bool isTracked(const MMutex& mutex)
{
    return mutex.m_type == MMutex_::MutexChecked || mutex.m_type == MMutex_::MutexRecursive;
}

// Both take m_guard; a caller may hold m_mutex.
MutexRecord readRecord(MMutex& mutex);
void writeRecord(MMutex& mutex, const MutexRecord& record);

}  // namespace tessaline

#endif
