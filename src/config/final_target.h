// The file a configuration name finally names, through any symbolic links.
#ifndef TESSALINE_SRC_CONFIG_FINAL_TARGET_H
#define TESSALINE_SRC_CONFIG_FINAL_TARGET_H

#include <string>

namespace tessaline::config {

// Follows `name` while it is a symbolic link and stores in `target` the
// name of the file at the end of the chain, which need not exist (a
// dangling link). A relative link counts from the directory that holds the
// link; links in directory components are left to the kernel. False, with
// errno set, for a chain of more than 40 links (ELOOP, as a loop gives), a
// name that would pass the path limit (ENAMETOOLONG), or a name that cannot
// be looked at.
bool FinalTarget(const char* name, std::string& target);

}  // namespace tessaline::config

#endif
