// The host's macros come first: the engine's header leaves them alone.
#include "host_macros.h"
#include "tessaline/crypt/rvEncrypt.h"
#include "tessaline/crypt/twofish.h"

#include <gtest/gtest.h>

TEST(HeaderCoexistence, HostMacrosDefinedBefore)
{
    EXPECT_EQ(16, BLOCK_SIZE);
    EXPECT_EQ(1, TRUE);
}
