#include "dump.h"

#include <cctype>
#include <cstdio>
#include <initializer_list>
#include <string_view>

#include "text.h"

namespace tessaline::tools {

namespace {

using Entries = std::vector<std::pair<std::string, std::string>>;

void Append(std::string& out, std::initializer_list<std::string_view> pieces)
{
    for (std::string_view piece : pieces) {
        out += piece;
    }
}

// The length of the UTF-8 sequence at `at`, or 0 when it is not valid
// (overlong forms, surrogates and values past U+10FFFF included).
std::size_t Utf8Length(const std::string& text, std::size_t at)
{
    auto byte = [&](std::size_t i) { return static_cast<unsigned char>(text[i]); };
    unsigned char lead = byte(at);
    std::size_t length = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : 2;
    if (lead < 0xC2 || lead > 0xF4 || at + length > text.size()) {
        return 0;
    }
    // Allowed range of the second byte, narrower after these lead bytes.
    unsigned char low = lead == 0xE0 ? 0xA0 : lead == 0xF0 ? 0x90 : 0x80;
    unsigned char high = lead == 0xED ? 0x9F : lead == 0xF4 ? 0x8F : 0xBF;
    if (byte(at + 1) < low || byte(at + 1) > high) {
        return 0;
    }
    for (std::size_t i = at + 2; i < at + length; ++i) {
        if ((byte(i) & 0xC0) != 0x80) {
            return 0;
        }
    }
    return length;
}

void AppendJsonString(const std::string& text, std::string& out)
{
    out += '"';
    for (std::size_t i = 0; i < text.size();) {
        unsigned char c = static_cast<unsigned char>(text[i]);
        std::size_t length = c < 0x80 ? 1 : Utf8Length(text, i);
        if (c == '"' || c == '\\') {
            out += '\\';
            out += static_cast<char>(c);
        } else if (c >= 0x20 && c != 0x7F && length != 0) {
            out.append(text, i, length);
            i += length;
            continue;
        } else {
            char escaped[8];
            std::snprintf(escaped, sizeof escaped, "\\u%04x", c);
            out += escaped;
        }
        ++i;
    }
    out += '"';
}

std::string ShellName(const std::string& section, const std::string& key)
{
    std::string name = section + "_" + key;
    // The tool keeps the C locale, so only ASCII letters and digits count.
    for (char& c : name) {
        c = std::isalnum(static_cast<unsigned char>(c)) != 0 ? c : '_';
    }
    return std::isdigit(static_cast<unsigned char>(name.front())) != 0 ? "_" + name : name;
}

std::string ShellQuoted(const std::string& text)
{
    std::string quoted = "'";
    for (char c : text) {
        quoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
    }
    return quoted + "'";
}

void AppendJson(ConfigFile& file, const std::vector<std::string>& sections, std::string& out)
{
    out += "{";
    const char* sectionComma = "\n";
    for (const std::string& section : sections) {
        out += sectionComma;
        out += "  ";
        AppendJsonString(section, out);
        out += ": {";
        const char* keyComma = "\n";
        Entries entries = file.Entries(section);
        for (const auto& [key, value] : entries) {
            out += keyComma;
            out += "    ";
            AppendJsonString(key, out);
            out += ": ";
            AppendJsonString(value, out);
            keyComma = ",\n";
        }
        out += entries.empty() ? "}" : "\n  }";
        sectionComma = ",\n";
    }
    out += sections.empty() ? "}\n" : "\n}\n";
}

}  // namespace

void Dump(ConfigFile& file, const std::vector<std::string>& sections, const std::string& format, std::string& out)
{
    if (format == "json") {
        AppendJson(file, sections, out);
        return;
    }
    for (const std::string& section : sections) {
        Entries entries = file.Entries(section);
        if (format == "ini" && !section.empty() && !entries.empty()) {
            Append(out, {"[", section, "]\n"});
        }
        for (const auto& [key, value] : entries) {
            if (format == "ini") {
                Append(out, {key, " = ", Carried(value), "\n"});
            } else if (format == "lines") {
                Append(out, {"[ ", section, " ] ", key, " = ", value, "\n"});
            } else {
                Append(out, {ShellName(section, key), "=", ShellQuoted(value), "\n"});
            }
        }
    }
}

}  // namespace tessaline::tools
