// Side-file names.
#include <cstring>

#include "config/side_name.h"

std::string tessaline::config::SideFileName(const char* configName, const char* ext)
{
    const char* slash = std::strrchr(configName, '/');
    const char* file = slash == nullptr ? configName : slash + 1;
    const char* dot = std::strrchr(file, '.');
    std::string name = dot == nullptr ? std::string(configName) : std::string(configName, dot - configName);
    name.append(".").append(ext);
    if (name == configName) {
        name.assign(configName).append(".").append(ext);
    }
    return name;
}
