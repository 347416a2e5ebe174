// Side-file names, formed through rvFilename.
#include "config/side_name.h"
#include "tessaline/files/rvFilename.h"

namespace tessaline::config {

std::string SideFileName(const char* configName, const char* ext)
{
    rvFilename name(configName, 0);
    name.Ext(ext);
    std::string sideName(static_cast<const char*>(name));
    if (sideName == configName) {
        sideName.assign(configName).append(".").append(ext);
    }
    return sideName;
}

}  // namespace tessaline::config
