// Stands in for host headers (windows-style, OpenSSL) that make classic
// names macros, with values of their own.
#ifndef TRUE
#define TRUE 1
#endif
#ifndef BLOCK_SIZE
#define BLOCK_SIZE 16
#endif
