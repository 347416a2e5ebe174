// The texts of directory members, as the tree walks name them. They are
// formed without rvFilename's split, which asks the file system whether the
// whole text is a directory; the text does not depend on the answer.
#ifndef TESSALINE_SRC_FILES_MEMBER_TEXT_H
#define TESSALINE_SRC_FILES_MEMBER_TEXT_H

#include <cstddef>
#include <string>

namespace tessaline::files {

// The text of rvFilename::Join(0, 0, directory, name, 0) for the first
// `nameLength` characters of `name`.
std::string JoinedText(const char* directory, const char* name, size_t nameLength);

// The text that rvFilename(entry, 0) holds after Directory(directory).
std::string MemberText(const char* directory, const char* entry);

}  // namespace tessaline::files

#endif
