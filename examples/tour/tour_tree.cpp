#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include <fcntl.h>

#include "tessaline/tessaline.h"
#include "tour.h"

namespace {

// The names a pattern matches, sorted: the platform delivers them in no
// particular order.
std::string Matches(const std::string& pattern)
{
    std::vector<std::string> names;
    for (rvDirIterator it(pattern.c_str()); it != rvDirIterator(); ++it) {
        names.push_back(*it);
    }
    std::sort(names.begin(), names.end());
    std::string list;
    for (const std::string& name : names) {
        list += (list.empty() ? "" : ", ") + name;
    }
    return list;
}

}  // namespace

void TourTree()
{
    std::printf("\n== Files: trees ==\n");
    char scratch[] = "/tmp/tessaline-tour-XXXXXX";
    if (mkdtemp(scratch) == nullptr) {
        std::printf("no scratch directory\n");
        return;
    }
    const std::string source = std::string(TOUR_DATA_DIR) + "/tree";
    const std::string copy = std::string(scratch) + "/copy";

    int copied = rvCopyFile(source.c_str(), copy.c_str(), 1, 1, 0, 0, nullptr, nullptr, 0644);
    std::printf("copied the sample tree: %d files\n", copied);
    std::printf("the copy's *.txt: %s\n", Matches(copy + "/*.txt").c_str());
    std::printf("the copy's logs (with . and ..): %s\n", Matches(copy + "/logs").c_str());
    std::printf("the copy covers the source: %d\n", CompareDirectoriesByFileSize(source.c_str(), copy.c_str()));

    const std::string extra = copy + "/logs/extra.log";
    void* handle = CreateFile(extra.c_str(), O_RDWR | O_CREAT, 0, nullptr, O_TRUNC, 0644, nullptr);
    unsigned long written = 0;
    WriteFile(handle, "one more line\n", 14, &written, nullptr);
    std::printf("wrote %lu bytes through a handle; size by handle %lld, by name %lld\n", written,
                static_cast<long long>(GetFileSize64(handle)), static_cast<long long>(rvGetFileSize(extra.c_str())));
    CloseHandle(handle);
    std::printf("the source covers the copy now: %d\n", CompareDirectoriesByFileSize(copy.c_str(), source.c_str()));

    const std::string readme = copy + "/readme.txt";
    void* refused = CreateFile(readme.c_str(), O_RDWR | O_CREAT, 0, nullptr, O_EXCL, 0644, nullptr);
    char reason[64];
    std::printf("exclusive create of readme.txt: %s (%s)\n",
                refused == reinterpret_cast<void*>(static_cast<intptr_t>(-1)) ? "refused" : "made",
                GetLastErrorText(reason, sizeof reason, 0xFFFFFFFFul));

    std::printf("removed the copy: %d files\n", rvUnlink(copy.c_str(), 1));
    const int removed = rvUnlink(scratch, 1);
    std::printf("removed the scratch directory: %d files, still there: %d\n", removed, FileExists(scratch));
}
