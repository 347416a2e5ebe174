// Test seam of the configuration store's system calls: a test can make any
// of them fail with a chosen errno, without running it. Not installed and
// not exported: tests reach it by linking the library's objects statically.
#ifndef TESSALINE_SRC_CONFIG_SYS_SEAM_H
#define TESSALINE_SRC_CONFIG_SYS_SEAM_H

namespace tessaline::config::testing {

// Open is every open, the temporary file's included; Replace is the rename
// over an existing configuration file, Rename every other rename.
enum class SysCall { Open, Exists, Writable, Write, Sync, Close, Rename, Replace, Link, Unlink };

// Asked before each call; `path` is the file the call concerns (for
// Rename, its source). A nonzero result is the errno with which the call
// fails. Null restores the real calls.
typedef int (*FaultHook)(SysCall call, const char* path);

void SetFaultHook(FaultHook hook);

}  // namespace tessaline::config::testing

#endif
