// The limit of the name that rvConfig keeps for its file.
#ifndef TESSALINE_SRC_CONFIG_CONFIG_NAME_H
#define TESSALINE_SRC_CONFIG_CONFIG_NAME_H

#include <cstddef>

namespace tessaline::config {

// Longest name kept in m_szConfigName; a longer one is cut to this length,
// and the buffer's last two bytes are never part of it.
constexpr std::size_t kMaxConfigName = 4094;

}  // namespace tessaline::config

#endif
