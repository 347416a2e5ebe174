// Names of the files written beside a configuration file.
#ifndef TESSALINE_SRC_CONFIG_SIDE_NAME_H
#define TESSALINE_SRC_CONFIG_SIDE_NAME_H

#include <string>

namespace tessaline::config {

// `configName` with its extension replaced by `ext` (added when it has
// none). When that would be `configName` itself, as for "app.new" and "new",
// `ext` is appended to the whole name instead ("app.new.new"), so that a
// side file never overwrites the configuration file.
std::string SideFileName(const char* configName, const char* ext);

}  // namespace tessaline::config

#endif
