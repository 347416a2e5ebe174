// The locked lookup under _GetValue and the getters.
#ifndef TESSALINE_SRC_CONFIG_LOOKUP_H
#define TESSALINE_SRC_CONFIG_LOOKUP_H

#include "tessaline/config/rvConfig.h"

namespace tessaline::config {

// _GetValue without copies of its names: 1 and the value in *value, or 0
// with *value untouched. An empty section is the current section.
unsigned int FindValue(rvConfig& config, const rvConfig::cfgStr& key, rvConfig::cfgStr* value,
                       const rvConfig::cfgStr& section);

}  // namespace tessaline::config

#endif
