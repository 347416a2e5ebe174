/*
 * Export control for libtessaline.
 *
 * The library is built with hidden visibility; only declarations marked
 * TESSALINE_API reach the dynamic symbol table. TESSALINE_EXTERN_C_BEGIN/END
 * bracket the functions that keep plain, unmangled names so that C hosts and
 * dlsym() can find them.
 */
#ifndef TESSALINE_UTIL_EXPORT_H
#define TESSALINE_UTIL_EXPORT_H

#if defined(__GNUC__)
#define TESSALINE_API __attribute__((visibility("default")))
#else
#define TESSALINE_API
#endif

#ifdef __cplusplus
#define TESSALINE_EXTERN_C_BEGIN extern "C" {
#define TESSALINE_EXTERN_C_END }
#else
#define TESSALINE_EXTERN_C_BEGIN
#define TESSALINE_EXTERN_C_END
#endif

#endif
