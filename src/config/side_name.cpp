// Side-file names, formed through rvFilename.
#include "config/side_name.h"

#include <cstring>

#include "tessaline/files/rvFilename.h"

namespace tessaline::config {

namespace {

// Whether `sideName` is `configName` with only its extension replaced by
// `ext`: the same directory, the same file name up to its last dot.
bool ReplacesExtensionOnly(const std::string& configName, const std::string& sideName, const char* ext)
{
    const std::size_t extLength = std::strlen(ext);
    if (sideName.size() <= extLength || sideName.compare(sideName.size() - extLength, extLength, ext) != 0 ||
        sideName[sideName.size() - extLength - 1] != '.') {
        return false;
    }
    const std::size_t stemLength = sideName.size() - extLength - 1;
    const std::size_t slash = configName.rfind('/');
    const std::size_t directoryLength = slash == std::string::npos ? 0 : slash + 1;
    if (stemLength < directoryLength || configName.compare(0, stemLength, sideName, 0, stemLength) != 0) {
        return false;
    }
    const std::size_t oldExt = stemLength;
    return oldExt == configName.size() ||
           (configName[oldExt] == '.' && configName.find('.', oldExt + 1) == std::string::npos);
}

}  // namespace

std::string SideFileName(const std::string& configName, const char* ext)
{
    rvFilename name(configName.c_str(), 0);
    name.Ext(ext);
    std::string sideName(static_cast<const char*>(name));
    if (sideName == configName || !ReplacesExtensionOnly(configName, sideName, ext)) {
        sideName.assign(configName).append(".").append(ext);
    }
    return sideName;
}

}  // namespace tessaline::config
