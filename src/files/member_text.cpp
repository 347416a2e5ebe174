// The texts of directory members, as the tree walks name them.
#include "files/member_text.h"

#include <algorithm>
#include <cstring>

#include "files/path_limits.h"

namespace tessaline::files {

std::string JoinedText(const char* directory, const char* name, size_t nameLength)
{
    std::string text = directory;
    if (!text.empty() && text.back() != '/' && text.back() != '\\') {
        text += '/';
    }
    text.append(name, nameLength);
    const size_t translated = std::min(text.size(), kMaxTranslateLength);
    std::replace(text.begin(), text.begin() + static_cast<std::ptrdiff_t>(translated), '\\', '/');
    return text;
}

std::string MemberText(const char* directory, const char* entry)
{
    // An entry holds no "/", so it splits into file and extension alone; an
    // empty extension drops its dot ("a." joins as "a", "..." as "..").
    const char* dot = std::strrchr(entry, '.');
    const bool emptyExtension = dot != nullptr && dot[1] == '\0';
    return JoinedText(directory, entry, emptyExtension ? static_cast<size_t>(dot - entry) : std::strlen(entry));
}

}  // namespace tessaline::files
