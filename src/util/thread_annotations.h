// Clang's thread-safety annotations, so that the compiler checks the lock
// contracts of the library's internal state (-Wthread-safety, on in every
// clang build of the library). They expand to nothing under other compilers.
// Prefixed, because hosts' own headers define the short names.
#ifndef TESSALINE_SRC_UTIL_THREAD_ANNOTATIONS_H
#define TESSALINE_SRC_UTIL_THREAD_ANNOTATIONS_H

#if defined(__clang__)
#define TESSALINE_THREAD_ANNOTATION(x) __attribute__((x))
#else
#define TESSALINE_THREAD_ANNOTATION(x)
#endif

// A type that works as a lock.
#define TESSALINE_CAPABILITY(name) TESSALINE_THREAD_ANNOTATION(capability(name))
// A guard object that holds a lock for its scope.
#define TESSALINE_SCOPED_CAPABILITY TESSALINE_THREAD_ANNOTATION(scoped_lockable)
// Data read and written only under the lock.
#define TESSALINE_GUARDED_BY(lock) TESSALINE_THREAD_ANNOTATION(guarded_by(lock))
// The data a pointer points to is guarded by the lock.
#define TESSALINE_PT_GUARDED_BY(lock) TESSALINE_THREAD_ANNOTATION(pt_guarded_by(lock))
// The caller must hold, or must not hold, the lock.
#define TESSALINE_REQUIRES(...) TESSALINE_THREAD_ANNOTATION(requires_capability(__VA_ARGS__))
#define TESSALINE_EXCLUDES(...) TESSALINE_THREAD_ANNOTATION(locks_excluded(__VA_ARGS__))
// The function takes, or releases, the lock.
#define TESSALINE_ACQUIRE(...) TESSALINE_THREAD_ANNOTATION(acquire_capability(__VA_ARGS__))
#define TESSALINE_RELEASE(...) TESSALINE_THREAD_ANNOTATION(release_capability(__VA_ARGS__))
#define TESSALINE_TRY_ACQUIRE(...) TESSALINE_THREAD_ANNOTATION(try_acquire_capability(__VA_ARGS__))
// The function returns the lock that guards something.
#define TESSALINE_RETURN_CAPABILITY(lock) TESSALINE_THREAD_ANNOTATION(lock_returned(lock))
// Tells the analysis the lock is held here, where it cannot see why.
#define TESSALINE_ASSERT_CAPABILITY(lock) TESSALINE_THREAD_ANNOTATION(assert_capability(lock))
// For the few spans the analysis cannot follow; say why at each use.
#define TESSALINE_NO_THREAD_SAFETY_ANALYSIS TESSALINE_THREAD_ANNOTATION(no_thread_safety_analysis)

#endif
