// rvConfig on arbitrary files. The input becomes a file, which is loaded,
// enumerated, changed, flushed into a temporary folder and loaded again.
// Besides "no crash" it checks what the reading and writing rules guarantee:
//
//  1. Flush leaves the table as it was, entry for entry and in its order.
//  2. What was flushed reads back: every entry the file format can carry
//     (see Representable) has its value in the rewritten file, and the
//     rewritten file holds no key that the table did not.
//  3. A rewrite of a file the writer produced changes nothing but the
//     identification line (the last line).
//
// The writer escapes nothing, so some texts cannot survive a round trip by
// the rules themselves; the checks leave them out rather than bend the
// rules:
//  - a value that is empty, begins with a double quote or has blanks at an
//    end: the reader drops the empty value, removes the quote and trims;
//  - a key or section name the reader would take apart (delimiter, bracket,
//    comment character in front, line end, blanks at an end). Files give
//    such keys too: a key line that begins with the delimiter ("=[x = 1")
//    holds the key "[x", which is written back as "[x = 1", a section line
//    that moves every key below it into another section;
//  - a written line of 4094 bytes or more, which the reader takes in pieces
//    (and the second piece may be a section line too);
//  - keys in the section with the empty name, which the writer leaves out
//    unless the old file has a header for it.
// Where a name or a line would change the structure of the file, check 2 is
// left out as a whole; where only a value would not come back, that value.
// For check 3 the rewritten file must itself be a writer's file: a blank
// line copied from the input without its line end (one cut short by a NUL
// byte, or the last line of a file without a final newline) runs into the
// next line that is written, and the next rewrite writes that line anew
// without the blanks in front. So check 3 compares the second and the third
// generation (F2 and F3), where the first rewrite (F1) has removed those.
#include <fuzzer/FuzzedDataProvider.h>

#include <stdlib.h>
#include <string.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <sstream>
#include <string>
#include <vector>

#include "fuzz_check.h"
#include "tessaline/config/rvConfig.h"

namespace {

constexpr size_t kLinePiece = 4094;

std::string g_directory;
std::string g_path;

struct Entry {
    std::string section;
    std::string key;
    std::string value;
    bool operator==(const Entry& other) const
    {
        return section == other.section && key == other.key && value == other.value;
    }
};

using Table = std::vector<Entry>;

void RemoveDirectory()
{
    std::error_code ignored;
    std::filesystem::remove_all(g_directory, ignored);
}

std::string ReadFile(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

void WriteFile(const std::string& path, const std::string& text)
{
    std::ofstream out(path, std::ios::binary | std::ios::trunc);
    out.write(text.data(), static_cast<std::streamsize>(text.size()));
    FUZZ_CHECK(out.good());
}

// The table in enumeration order, with the counts checked on the way.
Table Snapshot(rvConfig& config)
{
    std::vector<std::string> sections;
    for (const char* name = config.EnumSections(1); name != nullptr; name = config.EnumSections(0))
        sections.push_back(name);
    FUZZ_CHECK(sections.size() == config.SectionCnt());

    Table table;
    for (const std::string& section : sections) {
        std::vector<std::string> keys;
        for (const char* key = config.EnumTokens(section.c_str(), 1); key != nullptr;
             key = config.EnumTokens(section.c_str(), 0))
            keys.push_back(key);
        FUZZ_CHECK(keys.size() == config.TokenCnt(section.c_str()));
        // "" in GetValue is the current section, so select it first.
        FUZZ_CHECK(config.Section(section.c_str(), 0) == 1);
        for (const std::string& key : keys) {
            const char* value = config.GetValue(key.c_str(), static_cast<const char*>(nullptr), "");
            FUZZ_CHECK(value != nullptr);
            table.push_back({section, key, value});
        }
    }
    return table;
}

bool IsTrimmed(const std::string& text)
{
    static const char kTrim[] = " \t\r\n";
    return !text.empty() && !strchr(kTrim, text.front()) && !strchr(kTrim, text.back());
}

bool HasAny(const std::string& text, const char* characters)
{
    return text.find_first_of(characters) != std::string::npos;
}

bool RepresentableSection(const std::string& name)
{
    return IsTrimmed(name) && !HasAny(name, "[]\n") && name.size() + 2 < kLinePiece;
}

bool RepresentableKey(const std::string& key)
{
    return IsTrimmed(key) && !HasAny(key, "=\n") && !strchr("#;/[]", key.front());
}

bool RepresentableValue(const std::string& value)
{
    return IsTrimmed(value) && !HasAny(value, "\n") && value.front() != '"';
}

// Names and line lengths that the reader takes back as the writer meant
// them. Values play no part in the structure of the file.
bool KeepsStructure(const Entry& entry)
{
    return (entry.section.empty() || RepresentableSection(entry.section)) && RepresentableKey(entry.key) &&
           entry.key.size() + 3 + entry.value.size() < kLinePiece;
}

bool SameName(const std::string& a, const std::string& b)
{
    return strcasecmp(a.c_str(), b.c_str()) == 0;
}

// Check 2: `written` was flushed, `read` is what the file gave back.
void CheckReadBack(const Table& written, const Table& read, rvConfig& reader, const std::string& file)
{
    for (const Entry& entry : written) {
        if (!KeepsStructure(entry))
            return;
    }
    bool everyValueRepresentable = true;
    for (const Entry& entry : written) {
        if (!RepresentableValue(entry.value)) {
            everyValueRepresentable = false;
            continue;
        }
        if (entry.section.empty())
            continue;
        const char* value =
            reader.GetValue(entry.key.c_str(), static_cast<const char*>(nullptr), entry.section.c_str());
        if (value == nullptr || entry.value != value) {
            fprintf(stderr, "[%s] %s = %s read back as %s from:\n%s---\n", entry.section.c_str(), entry.key.c_str(),
                    entry.value.c_str(), value ? value : "(missing)", file.c_str());
            FUZZ_CHECK(value != nullptr && entry.value == value);
        }
    }
    if (!everyValueRepresentable)
        return;
    for (const Entry& entry : read) {
        bool known = false;
        for (const Entry& original : written)
            known = known || (SameName(entry.section, original.section) && SameName(entry.key, original.key));
        FUZZ_CHECK(known);
    }
}

// The file without its last line, the identification line.
std::string WithoutLastLine(const std::string& text)
{
    size_t end = text.size();
    if (end > 0 && text[end - 1] == '\n')
        --end;
    const size_t lastLineStart = text.rfind('\n', end == 0 ? 0 : end - 1);
    return lastLineStart == std::string::npos ? std::string() : text.substr(0, lastLineStart + 1);
}

bool HasLongLine(const std::string& text)
{
    std::istringstream lines(text);
    std::string line;
    while (std::getline(lines, line)) {
        if (line.size() + 1 > kLinePiece)
            return true;
    }
    return false;
}

// Rewrites the file with no change but the forced flag; returns its new text.
std::string Rewrite(Table* table)
{
    rvConfig config(g_path.c_str(), rvConfig::OpenUpdate);
    if (table)
        *table = Snapshot(config);
    config.IsModified(1);
    FUZZ_CHECK(config.Flush(0) == 1);
    return ReadFile(g_path);
}

// A name for a change: one the table holds, a tidy one, or anything.
std::string TakeName(FuzzedDataProvider& input, const Table& table, bool section, bool& tidy)
{
    switch (input.ConsumeIntegralInRange(0, 3)) {
    case 0:
        if (!table.empty()) {
            const Entry& entry = table[input.ConsumeIntegralInRange<size_t>(0, table.size() - 1)];
            return section ? entry.section : entry.key;
        }
        return "k";
    case 1: {
        std::string text = input.ConsumeRandomLengthString(24);
        tidy = false;
        return text;
    }
    default: {
        std::string text;
        for (char c : input.ConsumeRandomLengthString(24)) {
            if (c > ' ' && c < 127 && !strchr("=[]#;/\"", c))
                text += c;
        }
        return text.empty() ? std::string("x") : text;
    }
    }
}

// Changes, through every kind of store and removal. Returns false when a
// text was stored that the format cannot carry.
bool Change(FuzzedDataProvider& input, rvConfig& config, const Table& table)
{
    bool tidy = true;
    const int changes = input.ConsumeIntegralInRange(0, 6);
    for (int i = 0; i < changes; ++i) {
        std::string section = TakeName(input, table, true, tidy);
        const std::string key = TakeName(input, table, false, tidy);
        switch (input.ConsumeIntegralInRange(0, 8)) {
        case 0: {
            bool valueTidy = true;
            const std::string value = TakeName(input, table, false, valueTidy);
            tidy = tidy && valueTidy;
            config.PutValue(key.c_str(), value.c_str(), section.c_str());
            break;
        }
        case 1:
            config.PutValue(key.c_str(), input.ConsumeIntegral<int>(), section.c_str());
            break;
        case 2:
            config.PutValue(key.c_str(), input.ConsumeFloatingPoint<double>(), section.c_str());
            break;
        case 3:
            config.PutBool(key.c_str(), input.ConsumeIntegral<unsigned int>(), section.c_str());
            break;
        case 4: {
            // Rope text may hold NUL bytes; the table sees the text up to
            // the first of them.
            const std::string bytes = input.ConsumeBytesAsString(input.ConsumeIntegralInRange(0, 24));
            tidy = false;
            config.PutValue(__gnu_cxx::crope(key.c_str()), __gnu_cxx::crope(bytes.data(), bytes.size()),
                            __gnu_cxx::crope(section.c_str()));
            break;
        }
        case 5:
            config.RemoveKey(section.c_str(), key.c_str());
            break;
        case 6:
            config.RemoveSection(section.c_str());
            break;
        case 7:
            config.Section(section.c_str(), 1);
            break;
        default: {
            // Lookups change nothing.
            const unsigned int modified = config.IsModified();
            const unsigned int items = config.IsValid();
            (void)config.GetValue(key.c_str(), 5, section.c_str());
            (void)config.GetValue(key.c_str(), 2.5, section.c_str());
            (void)config.GetBool(key.c_str(), 7, section.c_str());
            __gnu_cxx::crope out;
            config.GetValue(out, key.c_str(), "def", section.c_str());
            FUZZ_CHECK(config.IsModified() == modified && config.IsValid() == items);
            break;
        }
        }
        // A store with "" as section goes to the current section, which
        // must then be one the file can carry too.
        if (section.empty())
            section = config.Section();
        tidy = tidy && (section.empty() || RepresentableSection(section));
    }
    return tidy;
}

// The writer syncs every file it writes, which on a disk costs ten times
// the rest of a run: the files live in memory where the system offers it.
std::string WorkArea()
{
    if (access("/dev/shm", W_OK) == 0)
        return "/dev/shm";
    const char* base = getenv("TMPDIR");
    return base && *base ? base : "/tmp";
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***)
{
    std::string pattern = WorkArea() + "/tessaline-fuzz-config.XXXXXX";
    FUZZ_CHECK(mkdtemp(pattern.data()) != nullptr);
    g_directory = pattern;
    g_path = g_directory + "/app.ini";
    atexit(RemoveDirectory);
    // Backups are a class-wide setting, reached through any object.
    rvConfig().CreateBackups(0);
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    FuzzedDataProvider input(data, size);
    const std::string original = input.ConsumeRandomLengthString(size);
    WriteFile(g_path, original);

    // F0 to F1: load, enumerate, change, flush.
    Table flushed;
    bool tidy;
    {
        rvConfig config(g_path.c_str(), rvConfig::OpenUpdate);
        FUZZ_CHECK(strcmp(config.ConfigName(), g_path.c_str()) == 0);
        const Table loaded = Snapshot(config);
        tidy = Change(input, config, loaded);
        const Table before = Snapshot(config);
        if (!config.IsModified()) {
            // Nothing to write: no file is touched. F1 must be a rewrite
            // all the same.
            FUZZ_CHECK(config.Flush(0) == 1);
            FUZZ_CHECK(ReadFile(g_path) == original);
            config.IsModified(1);
        }
        FUZZ_CHECK(config.Flush(0) == 1);
        FUZZ_CHECK(config.IsModified() == 0);
        FUZZ_CHECK(!std::filesystem::exists(g_directory + "/app.new"));
        flushed = Snapshot(config);
        FUZZ_CHECK(flushed == before);
    }

    const std::string first = ReadFile(g_path);
    if (tidy) {
        rvConfig reader(g_path.c_str(), rvConfig::OpenUpdate);
        CheckReadBack(flushed, Snapshot(reader), reader, first);
    }

    // F1 to F2 to F3, with no change but the forced flag. F2 is written
    // from what F1 gave, and only values the format carries come back the
    // same.
    Table firstTable;
    const std::string second = Rewrite(&firstTable);
    const std::string third = Rewrite(nullptr);
    if (HasLongLine(second))
        return 0;
    for (const Entry& entry : firstTable) {
        if (!KeepsStructure(entry) || !RepresentableValue(entry.value))
            return 0;
    }
    if (WithoutLastLine(third) != WithoutLastLine(second)) {
        fprintf(stderr, "--- F1:\n%s--- F2:\n%s--- F3:\n%s---\n", first.c_str(), second.c_str(), third.c_str());
        FUZZ_CHECK(WithoutLastLine(third) == WithoutLastLine(second));
    }
    return 0;
}
