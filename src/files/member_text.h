// The text of a directory member, as the tree walks name it.
#ifndef TESSALINE_SRC_FILES_MEMBER_TEXT_H
#define TESSALINE_SRC_FILES_MEMBER_TEXT_H

#include <string>

namespace tessaline::files {

// The text that rvFilename(entry, 0) holds after Directory(directory). The
// text does not depend on how the joined name is split again, so it is
// formed without that split, which asks the file system whether the whole
// text is a directory.
std::string MemberText(const char* directory, const char* entry);

}  // namespace tessaline::files

#endif
