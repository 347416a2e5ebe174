#include "text.h"

#include <tessaline/config/rvConfig.h>

#include <cstring>

#include "failure.h"

namespace tessaline::tools {

namespace {

constexpr char kBlanks[] = " \t";
// The reader takes lines of at most this many bytes, line end included.
constexpr std::size_t kLongestLine = 4094;
// What the writer puts between key and value.
constexpr std::size_t kDelimiterWidth = 3;

bool IsBlank(char c)
{
    return c == ' ' || c == '\t';
}

bool BlankAtAnEnd(const std::string& text)
{
    return !text.empty() && (IsBlank(text.front()) || IsBlank(text.back()));
}

std::string Trimmed(const std::string& text)
{
    std::string::size_type first = text.find_first_not_of(kBlanks);
    if (first == std::string::npos) {
        return std::string();
    }
    return text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}

Failure NotCarried(const std::string& what, const std::string& name)
{
    return Failure{kUsage, what + " '" + name + "' cannot be stored: the file would read it back differently"};
}

}  // namespace

void CheckOneLine(const std::string& text, const char* what)
{
    if (text.find_first_of(std::string("\n\r\0", 3)) != std::string::npos) {
        throw Failure{kUsage, std::string(what) + " holds a line break or NUL, which the file cannot carry"};
    }
}

void CheckStorableKey(const std::string& key)
{
    if (key.empty()) {
        throw Failure{kUsage, "an empty key cannot be stored"};
    }
    if (BlankAtAnEnd(key) || std::strchr(rvConfig::m_szCommentChars, key.front()) != nullptr ||
        std::strchr(rvConfig::m_szSectionChars, key.front()) != nullptr ||
        key.find_first_of(rvConfig::m_szDelimChars) != std::string::npos) {
        throw NotCarried("key", key);
    }
}

void CheckStorableSection(const std::string& section)
{
    if (BlankAtAnEnd(section) || section.find_first_of(rvConfig::m_szSectionChars) != std::string::npos ||
        section.size() + 3 > kLongestLine) {
        throw NotCarried("section", section);
    }
}

void CheckLineLength(const std::string& key, const std::string& carriedValue)
{
    if (key.size() + kDelimiterWidth + carriedValue.size() + 1 > kLongestLine) {
        throw Failure{kUsage, "the line of key '" + key + "' would be longer than the file's " +
                                  std::to_string(kLongestLine) + "-byte limit"};
    }
}

std::string Carried(const std::string& value)
{
    if (value.empty() || value.front() == '"' || BlankAtAnEnd(value)) {
        return '"' + value + '"';
    }
    return value;
}

std::vector<std::string> ListItems(const std::string& value, const std::string& separator)
{
    std::string core = Trimmed(separator);
    std::vector<std::string> items;
    std::string::size_type start = 0;
    while (start <= value.size()) {
        std::string::size_type end = core.empty() ? value.find_first_of(kBlanks, start) : value.find(core, start);
        if (end == std::string::npos) {
            end = value.size();
        }
        std::string item = Trimmed(value.substr(start, end - start));
        if (!item.empty()) {
            items.push_back(item);
        }
        start = end + (core.empty() ? 1 : core.size());
    }
    return items;
}

std::string JoinItems(const std::vector<std::string>& items, const std::string& separator)
{
    std::string joined;
    for (const std::string& item : items) {
        if (!joined.empty()) {
            joined += separator;
        }
        joined += item;
    }
    return joined;
}

}  // namespace tessaline::tools
