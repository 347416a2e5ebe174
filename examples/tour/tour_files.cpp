#include <cstdio>

#include "tessaline/tessaline.h"
#include "tour.h"

namespace {

void ShowName(rvFilename& name)
{
    std::printf("%s\n", name());
    std::printf("  scheme \"%s\"  server \"%s\"  directory \"%s\"  file \"%s\"  ext \"%s\"\n", name.Scheme(),
                name.Server(), name.Directory(), name.File(), name.Ext());
    std::printf("  Pathname \"%s\"  Filename \"%s\"  IsURL %d\n", name.Pathname(), name.Filename(), name.IsURL());
}

void LoadPlugin()
{
#ifdef TOUR_PLUGIN_DIR
    // No extension given: rvSharedLib adds ".so".
    rvSharedLib plugin(TOUR_PLUGIN_DIR "/libtessaline_tour_plugin", 0);
    if (!plugin.IsValid()) {
        std::printf("the tour's plugin did not load (error %d)\n", plugin.m_error);
        return;
    }
    std::printf("rvSharedLib(\"<plugin dir>/%s\"): IsValid %d, disposition 0x%x\n", plugin.m_name.Filename(),
                plugin.IsValid(), plugin.Disposition());
    using Greeting = const char* (*)();
    auto greeting = reinterpret_cast<Greeting>(plugin.ProcAddr("tour_plugin_greeting"));
    std::printf("tour_plugin_greeting() says \"%s\"\n", greeting ? greeting() : "(missing)");
    int first = plugin.Close();
    int second = plugin.Close();
    std::printf("Close: %d, and again: %d\n", first, second);
#else
    std::printf("(this build of the tour has no plugin to load)\n");
#endif
}

}  // namespace

void TourFiles()
{
    std::printf("\n== Files ==\n");
    rvFilename url("http://example.org/docs/guide.html", 0);
    ShowName(url);
    rvFilename path("/srv/reports/2024/summary.tar.gz", 0);
    ShowName(path);
    std::printf("Ext(\"zip\") rewrites it: %s\n", path.Ext("zip"));
    std::printf("Directory(\"/archive\") moves it: %s\n", path.Directory("/archive"));

    char dos[] = "ftp://host/pub/file.txt";
    std::printf("XlatPathToDOS: %s\n", rvFilename::XlatPathToDOS(dos));
    std::printf("FileExists(\"/\"): %d, FileExists(\"/no/such/file\"): %d\n", FileExists("/"),
                FileExists("/no/such/file"));
    LoadPlugin();
}
