// Edits a configuration file: reads values, changes one, adds a key and a
// section, and saves. The saved file keeps the comments and the layout.
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include <unistd.h>

#include "tessaline/config/rvConfig.h"

namespace {

const char kOriginal[] =
    "# Settings of the example service.\n"
    "[server]\n"
    "; the port clients connect to\n"
    "port = 8080\n"
    "host = localhost\n"
    "\n"
    "[logging]\n"
    "level = info\n";

void writeFile(const std::string& path, const char* text)
{
    if (FILE* out = std::fopen(path.c_str(), "w")) {
        std::fputs(text, out);
        std::fclose(out);
    }
}

// The last line of a saved file names the library and the time of the save;
// the time is left out here so that the output is always the same.
void printFile(const std::string& path)
{
    FILE* in = std::fopen(path.c_str(), "r");
    char line[4096];
    while (in != nullptr && std::fgets(line, sizeof line, in) != nullptr) {
        if (std::strncmp(line, rvConfig::m_szIdString, std::strlen(rvConfig::m_szIdString)) == 0) {
            std::printf("  | %s: <time of the save>\n", rvConfig::m_szIdString);
        } else {
            std::printf("  |%s%s", line[0] == '\n' ? "" : " ", line);
        }
    }
    if (in != nullptr) {
        std::fclose(in);
    }
}

}  // namespace

int main()
{
    const char* tmp = std::getenv("TMPDIR");
    std::string directory = std::string(tmp != nullptr && *tmp != '\0' ? tmp : "/tmp") + "/config_edit-XXXXXX";
    if (mkdtemp(&directory[0]) == nullptr) {
        std::perror("mkdtemp");
        return 1;
    }
    const std::string path = directory + "/service.ini";
    writeFile(path, kOriginal);

    {
        rvConfig config(path.c_str(), rvConfig::OpenUpdate);
        // Names match in any case; values are text until read as numbers.
        std::printf("port: %d\n", config.GetValue("PORT", 80, "Server"));
        std::printf("level: %s\n", config.GetValue("level", "warning", "logging"));
        std::printf("timeout (missing): %s\n", config.GetValue("timeout", "30", "server"));

        config.PutValue("port", 9090, "server");             // change a value
        config.PutValue("timeout", 45, "server");            // add a key
        config.PutValue("path", "/var/cache/app", "cache");  // add a section
        std::printf("modified: %u\n", config.IsModified());
        std::printf("saved: %u\n", config.Flush(0));
    }

    std::printf(
        "\nThe saved file: comments stay, a new key ends its section (after the\n"
        "blank line that closed it), a new section comes last.\n");
    printFile(path);

    rvConfig reread(path.c_str(), rvConfig::OpenRead);
    std::printf("\nread back: port %d, timeout %d, cache path %s\n", reread.GetValue("port", 0, "server"),
                reread.GetValue("timeout", 0, "server"), reread.GetValue("path", "", "cache"));

    // With backups off (the default) the save leaves no side files.
    unlink(path.c_str());
    rmdir(directory.c_str());
    return 0;
}
