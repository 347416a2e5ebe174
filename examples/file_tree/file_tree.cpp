// Names and trees: takes a URL and a path apart, builds a small directory
// tree, copies it, lists and compares the copy, and removes everything.
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include <fcntl.h>

#include "tessaline/files/rvCopy.h"
#include "tessaline/files/rvDirIterator.h"
#include "tessaline/files/rvFileApi.h"
#include "tessaline/files/rvFilename.h"
#include "tessaline/files/rvPath.h"

namespace {

void showParts(rvFilename& name)
{
    std::printf("%s\n  scheme \"%s\" server \"%s\" directory \"%s\" file \"%s\" ext \"%s\"\n", name(), name.Scheme(),
                name.Server(), name.Directory(), name.File(), name.Ext());
}

void writeFile(const std::string& path, const char* text)
{
    void* handle = CreateFile(path.c_str(), O_WRONLY | O_CREAT, 0, nullptr, O_TRUNC, 0644, nullptr);
    unsigned long written = 0;
    WriteFile(handle, text, std::strlen(text), &written, nullptr);
    CloseHandle(handle);
}

// Prints the tree under `top` with file sizes. The platform delivers entries
// in no particular order, so each directory is sorted first.
void listTree(const std::string& top, const std::string& relative = "")
{
    std::vector<std::string> names;
    for (rvDirIterator it((top + "/" + relative).c_str()); it != rvDirIterator(); ++it) {
        if (std::strcmp(*it, ".") != 0 && std::strcmp(*it, "..") != 0) {
            names.push_back(relative + *it);
        }
    }
    std::sort(names.begin(), names.end());
    for (const std::string& name : names) {
        const std::string path = top + "/" + name;
        if (rvFilename::IsDirectory(path.c_str()) != 0) {
            std::printf("  %s/\n", name.c_str());
            listTree(top, name + "/");
        } else {
            std::printf("  %-24s %lld bytes\n", name.c_str(), static_cast<long long>(rvGetFileSize(path.c_str())));
        }
    }
}

}  // namespace

int main()
{
    // remote 1: take the name apart as text only, without asking the disk.
    rvFilename url("https://downloads.example.org/releases/v2/tool-2.1.tar.gz", 1);
    showParts(url);
    rvFilename settings("/etc/example/service.ini", 1);
    showParts(settings);
    std::printf("  its backup: %s\n\n", settings.Ext("bak"));

    const char* tmp = std::getenv("TMPDIR");
    std::string scratch = std::string(tmp != nullptr && *tmp != '\0' ? tmp : "/tmp") + "/file_tree-XXXXXX";
    if (mkdtemp(&scratch[0]) == nullptr) {
        std::perror("mkdtemp");
        return 1;
    }
    const std::string source = scratch + "/source";
    const std::string copy = scratch + "/copy";

    // CreateDir makes the missing parents too.
    std::printf("CreateDir: %d %d\n", CreateDir((source + "/docs/notes").c_str(), 0),
                CreateDir((source + "/logs").c_str(), 0));
    writeFile(source + "/readme.txt", "A small tree.\n");
    writeFile(source + "/docs/guide.txt", "Step one: copy.\nStep two: compare.\n");
    writeFile(source + "/docs/notes/todo.txt", "remove it all\n");
    writeFile(source + "/logs/app.log", "started\nstopped\n");

    std::printf("copied the tree: %d files\n",
                rvCopyFile(source.c_str(), copy.c_str(), 1, 1, 0, 0, nullptr, nullptr, 0644));
    std::printf("the copy:\n");
    listTree(copy);
    std::printf("the copy has all of the source: %d\n", CompareDirectoriesByFileSize(source.c_str(), copy.c_str()));

    // A wildcard copies the matches into a directory; recurse 0 skips notes/.
    std::printf("copied docs/*: %d files\n", rvCopyFile((source + "/docs/*").c_str(), (scratch + "/flat").c_str(), 0, 1,
                                                        0, 0, nullptr, nullptr, 0644));

    writeFile(copy + "/logs/app.log", "started\n");
    std::printf("after a change in the copy: %d\n", CompareDirectoriesByFileSize(source.c_str(), copy.c_str()));

    std::printf("removed the copy: %d files\n", rvUnlink(copy.c_str(), 1));
    std::printf("removed the rest: %d files\n", rvUnlink(scratch.c_str(), 1));
    std::printf("scratch directory still there: %d\n", FileExists(scratch.c_str()));
    return 0;
}
