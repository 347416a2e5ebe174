// The public thread classes keep their counters and flags as plain integer
// fields (their layout is part of the interface). Where more than one thread
// touches such a field, the library reads and writes it through these, so
// that concurrent use is not a data race; ordering comes from the locks.
#ifndef TESSALINE_SRC_THREAD_RELAXED_H
#define TESSALINE_SRC_THREAD_RELAXED_H

namespace tessaline::thread {

template <typename T>
T LoadRelaxed(const T& field)
{
    return __atomic_load_n(&field, __ATOMIC_RELAXED);
}

template <typename T, typename U>
void StoreRelaxed(T& field, U value)
{
    __atomic_store_n(&field, static_cast<T>(value), __ATOMIC_RELAXED);
}

}  // namespace tessaline::thread

#endif
