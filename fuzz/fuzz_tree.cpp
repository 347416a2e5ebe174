// Random small trees with symbolic links, cycles included (links to ".",
// "..", the tree's top and the directory above it, a directory outside), and
// names that read as patterns or as other names, copied, compared and
// removed. Beyond "no crash": every call ends, nothing outside the trees
// changes, the copy leaves its source as it was, and no directory of the
// copy stands for a source directory that is already on its own path, which
// the copy would make only by entering a directory twice.
#include <fuzzer/FuzzedDataProvider.h>

#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "fuzz_check.h"
#include "tessaline/files/rvCopy.h"

namespace {

namespace fs = std::filesystem;

const char* const kNames[] = {"a", "b", "x*", "a?", "...", "c.", "d\\e", ".h"};
constexpr int kMaxSteps = 24;

// A scratch directory for the whole run, removed at exit.
class Scratch {
public:
    Scratch() : m_path((fs::temp_directory_path() / "tessaline-fuzz-tree-XXXXXX").string())
    {
        FUZZ_CHECK(mkdtemp(m_path.data()) != nullptr);
    }
    ~Scratch()
    {
        std::error_code ignored;
        fs::remove_all(m_path, ignored);
    }
    Scratch(const Scratch&) = delete;
    Scratch& operator=(const Scratch&) = delete;

    const std::string& Path() const { return m_path; }

private:
    std::string m_path;
};

const std::string& Root()
{
    static const Scratch scratch;
    return scratch.Path();
}

// Every entry below `top` without following links: files with their
// content, links with their text, directories as "/".
std::map<std::string, std::string> Snapshot(const std::string& top)
{
    std::map<std::string, std::string> entries;
    std::error_code error;
    for (fs::recursive_directory_iterator it(top, error), end; !error && it != end; it.increment(error)) {
        const fs::path& path = it->path();
        if (it->is_symlink()) {
            entries[path.string()] = "-> " + fs::read_symlink(path, error).string();
        } else if (it->is_directory()) {
            entries[path.string()] = "/";
        } else {
            std::ifstream in(path, std::ios::binary);
            entries[path.string()] = std::string(std::istreambuf_iterator<char>(in), {});
        }
    }
    return entries;
}

// The (device, inode) of a source directory, or nothing.
bool Identity(const std::string& path, std::pair<dev_t, ino_t>* identity)
{
    struct stat info;
    if (stat(path.c_str(), &info) != 0 || !S_ISDIR(info.st_mode)) {
        return false;
    }
    *identity = {info.st_dev, info.st_ino};
    return true;
}

// For every directory of the copy that has members, the source directories
// its path stands for (links followed, as the copy reads them) are all
// different. A directory the copy refused to enter stays empty.
void CheckNoDirectoryEnteredTwice(const std::string& source, const std::string& copy)
{
    std::error_code error;
    for (fs::recursive_directory_iterator it(copy, error), end; !error && it != end; it.increment(error)) {
        if (!it->is_directory() || it->is_symlink() || fs::is_empty(it->path(), error)) {
            continue;
        }
        std::vector<std::pair<dev_t, ino_t>> path;
        std::pair<dev_t, ino_t> identity;
        std::string walked = source;
        FUZZ_CHECK(Identity(walked, &identity));
        path.push_back(identity);
        for (const fs::path& part : it->path().lexically_relative(copy)) {
            walked += "/" + part.string();
            if (!Identity(walked, &identity)) {
                break;  // a name the copy formed differently ("c." as "c")
            }
            for (const auto& above : path) {
                FUZZ_CHECK(above != identity);
            }
            path.push_back(identity);
        }
    }
}

void Build(FuzzedDataProvider& input, const std::string& source, const std::string& outside)
{
    std::vector<std::string> directories = {source};
    for (int step = 0; step < kMaxSteps && input.remaining_bytes() > 0; ++step) {
        const std::string& parent = directories[input.ConsumeIntegralInRange<size_t>(0, directories.size() - 1)];
        const std::string path = parent + "/" + input.PickValueInArray(kNames);
        switch (input.ConsumeIntegralInRange(0, 3)) {
        case 0:
            if (mkdir(path.c_str(), 0755) == 0) {
                directories.push_back(path);
            }
            break;
        case 1:
            std::ofstream(path, std::ios::binary) << input.ConsumeRandomLengthString(64);
            break;
        case 2: {
            // Every link stays inside the scratch directory: a walk may read
            // all it leads to.
            const std::string targets[] = {".", "..", source, Root(), outside, directories.back(), "nowhere"};
            symlink(input.PickValueInArray(targets).c_str(), path.c_str());
            break;
        }
        default:
            symlink((outside + "/file").c_str(), path.c_str());
            break;
        }
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    FuzzedDataProvider input(data, size);
    const std::string source = Root() + "/src";
    const std::string copy = Root() + "/copy";
    const std::string outside = Root() + "/outside";
    std::error_code ignored;
    fs::remove_all(source, ignored);
    fs::remove_all(copy, ignored);
    fs::remove_all(outside, ignored);
    fs::create_directories(outside + "/sub");
    std::ofstream(outside + "/file") << "outside";
    std::ofstream(outside + "/sub/deeper") << "deeper";
    fs::create_directory(source);
    const unsigned overwrite = input.ConsumeBool() ? 1 : 0;
    Build(input, source, outside);

    const auto outsideBefore = Snapshot(outside);
    const auto sourceBefore = Snapshot(source);
    rvCopyFile(source.c_str(), copy.c_str(), 1, overwrite, 0, 0, nullptr, nullptr, 0644);
    FUZZ_CHECK(Snapshot(source) == sourceBefore);
    CheckNoDirectoryEnteredTwice(source, copy);
    CompareDirectoriesByFileSize(source.c_str(), copy.c_str());
    CompareDirectoriesByFileSize(copy.c_str(), source.c_str());
    rvUnlink(copy.c_str(), 1);
    FUZZ_CHECK(Snapshot(source) == sourceBefore);
    rvUnlink(source.c_str(), 1);
    FUZZ_CHECK(Snapshot(outside) == outsideBefore);
    return 0;
}
