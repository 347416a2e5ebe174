// Saving: Flush and the writing pass.
#include "config/passes.h"
#include "tessaline/config/rvConfig.h"

unsigned int rvConfig::Flush(unsigned int bClear)
{
    if (IsModified() != 0) {
        return 0;
    }
    if (bClear != 0) {
        Clear();
    }
    return 1;
}

unsigned int tessaline::config::WritePass(rvConfig&)
{
    return 0;
}
