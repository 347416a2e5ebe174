// A scratch directory tree for the file tests: made under the system's
// temporary directory by mkdtemp and removed, with everything in it, when the
// object goes.
#ifndef TESSALINE_TESTS_FILES_TEMP_TREE_H
#define TESSALINE_TESTS_FILES_TEMP_TREE_H

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <system_error>

#include <sys/stat.h>
#include <sys/types.h>

namespace tessaline::test {

class TempTree {
public:
    TempTree()
    {
        const char* base = std::getenv("TMPDIR");
        std::string pattern = std::string(base != nullptr && *base != '\0' ? base : "/tmp") +
                              "/tessaline-files-XXXXXX";
        m_root = mkdtemp(pattern.data()) != nullptr ? pattern : std::string();
    }

    ~TempTree()
    {
        if (m_root.empty()) {
            return;
        }
        // Directories a test made unreadable or unwritable must open again
        // before they can be emptied.
        std::error_code ignored;
        for (auto it = std::filesystem::recursive_directory_iterator(
                 m_root, std::filesystem::directory_options::skip_permission_denied, ignored);
             it != std::filesystem::recursive_directory_iterator(); it.increment(ignored)) {
            if (it->is_directory(ignored) && !it->is_symlink(ignored)) {
                chmod(it->path().c_str(), 0700);
            }
        }
        chmod(m_root.c_str(), 0700);
        std::filesystem::remove_all(m_root, ignored);
    }

    TempTree(const TempTree&) = delete;
    TempTree& operator=(const TempTree&) = delete;

    const std::string& Root() const { return m_root; }

    // The absolute name of `relative` inside the tree.
    std::string Path(const std::string& relative) const { return m_root + "/" + relative; }

    // Writes `content` to `relative`, making its directories first.
    std::string Write(const std::string& relative, const std::string& content) const
    {
        const std::string path = Path(relative);
        std::filesystem::create_directories(std::filesystem::path(path).parent_path());
        std::ofstream(path, std::ios::binary) << content;
        return path;
    }

    std::string MakeDir(const std::string& relative) const
    {
        const std::string path = Path(relative);
        std::filesystem::create_directories(path);
        return path;
    }

private:
    std::string m_root;
};

// The whole content of a file, or "<missing>" when it cannot be read.
inline std::string ReadAll(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    if (!in) {
        return "<missing>";
    }
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

inline bool Exists(const std::string& path)
{
    struct stat info;
    return lstat(path.c_str(), &info) == 0;
}

// Works in `directory` while the object lives.
class ScopedCwd {
public:
    explicit ScopedCwd(const std::string& directory) : m_saved(std::filesystem::current_path())
    {
        std::filesystem::current_path(directory);
    }
    ~ScopedCwd()
    {
        std::error_code ignored;
        std::filesystem::current_path(m_saved, ignored);
    }
    ScopedCwd(const ScopedCwd&) = delete;
    ScopedCwd& operator=(const ScopedCwd&) = delete;

private:
    std::filesystem::path m_saved;
};

}  // namespace tessaline::test

#endif
