// The host's macros come after the engine's header.
#include "tessaline/crypt/twofish.h"
#include "tessaline/crypt/rvEncrypt.h"
#include "host_macros.h"

static_assert(BLOCK_SIZE == 16 && TRUE == 1, "the host's macros stand");
