// Freeing a whole configuration's tables.
#ifndef TESSALINE_SRC_CONFIG_RELEASE_H
#define TESSALINE_SRC_CONFIG_RELEASE_H

#include "tessaline/config/rvConfig.h"

namespace tessaline::config {

// Empties the key table of every section, one section at a time; the
// sections themselves stay for the caller to clear.
void ReleaseKeys(rvConfig::SectionTable& sections);

}  // namespace tessaline::config

#endif
