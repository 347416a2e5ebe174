// The host's macros come first: the engine's header leaves them alone.
#include "host_macros.h"
#include "tessaline/crypt/rvEncrypt.h"
#include "tessaline/crypt/twofish.h"

static_assert(BLOCK_SIZE == 16 && TRUE == 1, "the host's macros stand");
