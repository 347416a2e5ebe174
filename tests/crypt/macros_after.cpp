// The host's macros come after the engine's header.
#include "tessaline/crypt/twofish.h"
#include "tessaline/crypt/rvEncrypt.h"
#include "host_macros.h"

#include <gtest/gtest.h>

TEST(HeaderCoexistence, HostMacrosDefinedAfter)
{
    EXPECT_EQ(16, BLOCK_SIZE);
    EXPECT_EQ(1, TRUE);
}
