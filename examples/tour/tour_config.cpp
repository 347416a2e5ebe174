#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include <unistd.h>

#include "tessaline/tessaline.h"
#include "tour.h"

namespace {

void listAndRead(rvConfig& config)
{
    // Table order, not file order: the buckets of the name hash, upward.
    for (const char* section = config.EnumSections(1); section != nullptr; section = config.EnumSections(0)) {
        std::printf("[%s]\n", section);
        for (const char* key = config.EnumTokens(section, 1); key != nullptr; key = config.EnumTokens(section, 0)) {
            std::printf("  %s = '%s'\n", key, config.GetValue(key, "", section));
        }
    }

    // Names match in any letter case; every value is text until asked for
    // as a number.
    std::printf("port in NETWORK: %s\n", config.GetValue("PORT", "80", "NETWORK"));
    std::printf("timeout as text: %s, as a double: %g, as an int: %d\n", config.GetValue("timeout", "?", "network"),
                config.GetValue("timeout", 0.0, "network"), config.GetValue("timeout", 0, "network"));
    std::printf("enabled as a bool: %u\n", config.GetBool("enabled", 0, "logging"));
    std::printf("missing key gives the default: %s\n", config.GetValue("proxy", "(none)", "network"));
    std::printf("no fallback to the default section: %s\n", config.GetValue("version", "(none)", "network"));
}

std::string copyOfSample(const std::string& directory)
{
    const std::string copy = directory + "/sample.ini";
    FILE* in = std::fopen(TOUR_DATA_DIR "/sample.ini", "r");
    FILE* out = std::fopen(copy.c_str(), "w");
    char buffer[4096];
    size_t count;
    while (in != nullptr && out != nullptr && (count = std::fread(buffer, 1, sizeof buffer, in)) > 0) {
        std::fwrite(buffer, 1, count, out);
    }
    if (in != nullptr) {
        std::fclose(in);
    }
    if (out != nullptr) {
        std::fclose(out);
    }
    return copy;
}

// Prints the saved file; its last line carries the time of the save, which
// is shown without the time so that the tour's output stays the same.
void printFile(const std::string& path)
{
    FILE* in = std::fopen(path.c_str(), "r");
    char line[4096];
    while (in != nullptr && std::fgets(line, sizeof line, in) != nullptr) {
        if (std::strncmp(line, rvConfig::m_szIdString, std::strlen(rvConfig::m_szIdString)) == 0) {
            std::printf("| %s: <time of the save>\n", rvConfig::m_szIdString);
        } else {
            std::printf("| %s", line);
        }
    }
    if (in != nullptr) {
        std::fclose(in);
    }
}

void changeAndSave()
{
    char directory[] = "/tmp/tessaline-tour-XXXXXX";
    if (mkdtemp(directory) == nullptr) {
        return;
    }
    const std::string path = copyOfSample(directory);
    {
        rvConfig config(path.c_str(), rvConfig::OpenUpdate);
        config.PutValue("port", 9090, "network");
        config.PutValue("retries", 3, "network");
        config.PutValue("name", "tour", "Audit");
        config.PutBool("enabled", 0, "logging");
        std::printf("saved: %u\n", config.Flush(0));
    }
    std::printf(
        "\nThe saved copy: comments and layout stay, new keys end their section,\n"
        "the new section comes last.\n");
    printFile(path);
    unlink(path.c_str());
    rmdir(directory);
}

}  // namespace

void TourConfig()
{
    std::printf("\n== Configuration ==\n");
    rvConfig config(TOUR_DATA_DIR "/sample.ini", rvConfig::OpenRead);
    std::printf("loaded %s: %u sections, %u items\n", config.IsValid() != 0 ? "sample.ini" : "nothing",
                config.SectionCnt(), config.IsValid());
    listAndRead(config);
    changeAndSave();
}
