// The text of a directory member, as the tree walks name it.
#include "files/member_text.h"

#include <algorithm>
#include <cstring>

#include "files/path_limits.h"

namespace tessaline::files {

std::string MemberText(const char* directory, const char* entry)
{
    std::string text = directory;
    if (!text.empty() && text.back() != '/' && text.back() != '\\') {
        text += '/';
    }
    // An entry holds no "/", so it splits into file and extension alone; an
    // empty extension drops its dot ("a." joins as "a", "..." as "..").
    const char* dot = std::strrchr(entry, '.');
    const bool emptyExtension = dot != nullptr && dot[1] == '\0';
    text.append(entry, emptyExtension ? static_cast<size_t>(dot - entry) : std::strlen(entry));
    const size_t translated = std::min(text.size(), kMaxTranslateLength);
    for (size_t i = 0; i < translated; ++i) {
        if (text[i] == '\\') {
            text[i] = '/';
        }
    }
    return text;
}

}  // namespace tessaline::files
