/**
 * @file
 * @brief Export control for libtessaline.
 *
 * The library is built with hidden visibility; only declarations marked
 * TESSALINE_API reach the dynamic symbol table. TESSALINE_EXTERN_C_BEGIN/END
 * bracket the functions that keep plain, unmangled names so that C hosts and
 * dlsym() can find them.
 */
#ifndef TESSALINE_EXPORT_H
#define TESSALINE_EXPORT_H

#if defined(__GNUC__)
/** Marks a class, function or variable that the library exports. */
#define TESSALINE_API __attribute__((visibility("default")))
#else
/** Marks a class, function or variable that the library exports. */
#define TESSALINE_API
#endif

#ifdef __cplusplus
/** Opens a run of declarations with plain C names (extern "C" in C++,
    nothing in C). */
#define TESSALINE_EXTERN_C_BEGIN extern "C" {
/** Closes a run opened by TESSALINE_EXTERN_C_BEGIN. */
#define TESSALINE_EXTERN_C_END }
#else
/** Opens a run of declarations with plain C names (extern "C" in C++,
    nothing in C). */
#define TESSALINE_EXTERN_C_BEGIN
/** Closes a run opened by TESSALINE_EXTERN_C_BEGIN. */
#define TESSALINE_EXTERN_C_END
#endif

#endif
