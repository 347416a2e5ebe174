// GLib's GKeyFile as a peer: case-sensitive, so looked up in the file's own
// letter case. Its save (g_file_set_contents) writes a new file, syncs it
// and renames it into place, as rvConfig's Flush does.
#include <glib.h>

#include "config_bench.h"

using namespace config_bench;

namespace {

GKeyFile* LoadFile(const std::string& path, GKeyFileFlags flags)
{
    GKeyFile* file = g_key_file_new();
    if (!g_key_file_load_from_file(file, path.c_str(), flags, nullptr)) {
        g_key_file_free(file);
        return nullptr;
    }
    return file;
}

void Load(benchmark::State& state, Size size)
{
    const std::string path = DataFile(size);
    for (auto _ : state) {
        GKeyFile* file = LoadFile(path, G_KEY_FILE_NONE);
        if (file == nullptr) {
            state.SkipWithError("cannot load");
            break;
        }
        g_key_file_free(file);
    }
    CountEntries(state, size);
}

void Lookup(benchmark::State& state, Size size)
{
    GKeyFile* file = LoadFile(DataFile(size), G_KEY_FILE_NONE);
    const std::vector<Name> names = AllNames(size, false);
    for (auto _ : state) {
        for (const Name& name : names) {
            gchar* value = g_key_file_get_value(file, name.section.c_str(), name.key.c_str(), nullptr);
            benchmark::DoNotOptimize(value);
            g_free(value);
        }
    }
    g_key_file_free(file);
    CountEntries(state, size);
}

// Comments are kept, as they are in a file that rvConfig rewrites.
void Flush(benchmark::State& state, Size size)
{
    ScratchCopy copy(size);
    GKeyFile* file = LoadFile(copy.Path(), G_KEY_FILE_KEEP_COMMENTS);
    long round = 0;
    for (auto _ : state) {
        for (const auto& [name, value] : Changes(size, round))
            g_key_file_set_value(file, name.section.c_str(), name.key.c_str(), value.c_str());
        if (!g_key_file_save_to_file(file, copy.Path().c_str(), nullptr)) {
            state.SkipWithError("cannot save");
            break;
        }
        ++round;
    }
    g_key_file_free(file);
    CountEntries(state, size);
}

[[maybe_unused]] const bool registered = [] {
    RegisterLoadLookup("gkeyfile", Load, Lookup);
    RegisterLarge("gkeyfile", Load, Lookup);
    RegisterFlush("gkeyfile", Flush);
    RegisterResident("gkeyfile", [](const std::string& path, auto measure) {
        GKeyFile* file = LoadFile(path, G_KEY_FILE_NONE);
        measure();
        g_key_file_free(file);
    });
    return true;
}();

}  // namespace
