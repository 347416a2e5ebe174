// The output formats of `dump`.
#ifndef TESSALINE_TOOLS_DUMP_H
#define TESSALINE_TOOLS_DUMP_H

#include <string>
#include <vector>

#include "config_file.h"

namespace tessaline::tools {

// Appends `sections` of `file` (names as on the command line, "" the
// default section) to `out` in `format`:
// - ini: as the library writes a new file: the default section's keys
//   without a header, then "[name]" and "key = value" lines, sections
//   without keys left out; no identification line. Values that the reader
//   would change (blanks at an end, empty, a leading quote) are quoted, so
//   the text reads back as the same keys and values.
// - lines: "[ section ] key = value", one line a key.
// - json: one object of objects, section -> key -> value. Valid UTF-8
//   passes through; control characters and bytes that are not UTF-8 are
//   written as \u00XX (the byte read as Latin-1).
// - sh: SECTION_KEY='value' lines for eval; every character of the name
//   outside [A-Za-z0-9_] becomes '_', and a name that would start with a
//   digit starts with '_'.
void Dump(ConfigFile& file, const std::vector<std::string>& sections, const std::string& format, std::string& out);

}  // namespace tessaline::tools

#endif
