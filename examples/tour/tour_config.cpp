#include <cstdio>

#include "tessaline/tessaline.h"
#include "tour.h"

void TourConfig()
{
    std::printf("\n== Configuration ==\n");
    rvConfig config(TOUR_DATA_DIR "/sample.ini", rvConfig::OpenRead);
    std::printf("loaded %s: %u sections, %u items\n", config.IsValid() != 0 ? "sample.ini" : "nothing",
                config.SectionCnt(), config.IsValid());

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
    std::printf("timeout as text: %s\n", config.GetValue("timeout", "?", "network"));
    std::printf("missing key gives the default: %s\n", config.GetValue("proxy", "(none)", "network"));
    std::printf("no fallback to the default section: %s\n", config.GetValue("version", "(none)", "network"));
}
