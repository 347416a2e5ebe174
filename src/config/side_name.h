// Names of the files written beside a configuration file.
#ifndef TESSALINE_SRC_CONFIG_SIDE_NAME_H
#define TESSALINE_SRC_CONFIG_SIDE_NAME_H

#include <string>

namespace tessaline::config {

// `configName` with its extension replaced by `ext` (added when it has
// none), always in the directory of `configName`. Where that would be
// `configName` itself ("app.new", "new"), or where the name does not come
// apart as a plain file name (a backslash, which file names turn into a
// directory separator, or a name longer than they take apart), `ext` is
// appended to the whole name instead ("app.new.new"), so that a side file
// never overwrites the configuration file or lands anywhere else.
std::string SideFileName(const std::string& configName, const char* ext);

}  // namespace tessaline::config

#endif
