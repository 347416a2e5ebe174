// The library's load-time objects (the configuration class lock, the thread
// semaphore) are constructed before every other static of the library and
// destroyed after them. The dynamic loader runs a library's initialisers
// before those of the objects that depend on it, so these are ready inside a
// host's own static constructors.
#ifndef TESSALINE_SRC_UTIL_LOAD_TIME_H
#define TESSALINE_SRC_UTIL_LOAD_TIME_H

#define TESSALINE_LOAD_TIME __attribute__((init_priority(101)))

#endif
