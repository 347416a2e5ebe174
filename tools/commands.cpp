#include "commands.h"

#include <fcntl.h>
#include <strings.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <memory>

#include "config_file.h"
#include "dump.h"
#include "failure.h"
#include "secret.h"
#include "text.h"

namespace tessaline::tools {

namespace {

Failure NotFound(const ConfigFile& file, const std::string& section, const std::string* key)
{
    std::string where = "section '" + section + "'";
    return Failure{kNotFound,
                   file.Name() + ": " + (key != nullptr ? "no key '" + *key + "' in " + where : "no " + where)};
}

// One line of standard input without its line end.
std::string ReadLine()
{
    char* buffer = nullptr;
    std::size_t capacity = 0;
    ssize_t length = getline(&buffer, &capacity, stdin);
    std::unique_ptr<char, decltype(&std::free)> owned(buffer, &std::free);
    if (length < 0) {
        if (std::ferror(stdin) != 0) {
            throw Failure{kFileError, "standard input: " + SystemText(errno)};
        }
        return std::string();
    }
    std::string line(buffer, static_cast<std::size_t>(length));
    for (char end : {'\n', '\r'}) {
        if (!line.empty() && line.back() == end) {
            line.pop_back();
        }
    }
    return line;
}

std::string OperandOrLine(const std::string& operand)
{
    return operand == "-" ? ReadLine() : operand;
}

void CheckNames(const std::vector<std::string>& operands, std::size_t first)
{
    static const char* const kWhat[] = {"FILE", "SECTION", "KEY", "the value"};
    for (std::size_t i = first; i < operands.size(); ++i) {
        CheckOneLine(operands[i], kWhat[std::min<std::size_t>(i, 3)]);
    }
}

void Get(const Arguments& arguments, std::string& out)
{
    const std::vector<std::string>& operand = arguments.operands;
    CheckNames(operand, 1);
    ConfigFile file(operand[0], ConfigFile::Missing::kFails);
    const char* found = file.Find(operand[1], operand[2]);
    std::string value;
    if (found != nullptr) {
        value = found;
    } else if (arguments.defaultText) {
        value = *arguments.defaultText;
    } else {
        throw NotFound(file, operand[1], file.HasSection(operand[1]) ? &operand[2] : nullptr);
    }
    if (arguments.decrypt) {
        value = Decrypted(value).value_or(value);
    }
    out += value + "\n";
}

void Set(const Arguments& arguments, std::string&)
{
    const std::vector<std::string>& operand = arguments.operands;
    std::string value = OperandOrLine(operand[3]);
    CheckNames(operand, 1);
    CheckOneLine(value, "the value");
    CheckOneLine(arguments.listSeparator, "--list-sep");
    CheckStorableSection(operand[1]);
    CheckStorableKey(operand[2]);
    if (arguments.encrypt) {
        value = Encrypted(value);
    }
    ConfigFile file(operand[0], ConfigFile::Missing::kReadsEmpty);
    const char* found = file.Find(operand[1], operand[2]);
    if (found == nullptr && arguments.existing) {
        throw NotFound(file, operand[1], file.HasSection(operand[1]) ? &operand[2] : nullptr);
    }
    std::string old = found != nullptr ? found : "";
    if (arguments.list) {
        std::vector<std::string> items = ListItems(old, arguments.listSeparator);
        bool added = false;
        for (const std::string& item : ListItems(value, arguments.listSeparator)) {
            if (std::find(items.begin(), items.end(), item) == items.end()) {
                items.push_back(item);
                added = true;
            }
        }
        value = added ? JoinItems(items, arguments.listSeparator) : old;
    }
    if (found == nullptr || value != old) {
        file.Store(operand[1], operand[2], value);
    }
    file.Save(arguments.backup, arguments.verbose);
}

void Del(const Arguments& arguments, std::string&)
{
    const std::vector<std::string>& operand = arguments.operands;
    CheckNames(operand, 1);
    // A missing file has nothing to remove, so it stays missing.
    ConfigFile file(operand[0], ConfigFile::Missing::kReadsEmpty);
    const std::string& section = operand[1];
    if (operand.size() == 2) {
        if (file.SectionHasContent(section)) {
            file.RemoveSection(section);
        } else if (arguments.existing) {
            throw NotFound(file, section, nullptr);
        }
    } else {
        const std::string& key = operand[2];
        const char* found = file.Find(section, key);
        if (found == nullptr) {
            if (arguments.existing) {
                throw NotFound(file, section, file.HasSection(section) ? &key : nullptr);
            }
        } else if (!arguments.list) {
            file.RemoveKey(section, key);
        } else {
            std::vector<std::string> items = ListItems(found, arguments.listSeparator);
            std::vector<std::string> gone = ListItems(operand[3], arguments.listSeparator);
            auto kept = std::remove_if(items.begin(), items.end(), [&](const std::string& item) {
                return std::find(gone.begin(), gone.end(), item) != gone.end();
            });
            if (kept != items.end()) {
                items.erase(kept, items.end());
                file.Store(section, key, JoinItems(items, arguments.listSeparator));
            }
        }
    }
    file.Save(false, arguments.verbose);
}

void Sections(const Arguments& arguments, std::string& out)
{
    ConfigFile file(arguments.operands[0], ConfigFile::Missing::kFails);
    for (const std::string& section : file.Sections()) {
        out += section + "\n";
    }
}

void Keys(const Arguments& arguments, std::string& out)
{
    const std::vector<std::string>& operand = arguments.operands;
    CheckNames(operand, 1);
    ConfigFile file(operand[0], ConfigFile::Missing::kFails);
    if (!file.HasSection(operand[1])) {
        throw NotFound(file, operand[1], nullptr);
    }
    for (const auto& entry : file.Entries(operand[1])) {
        out += entry.first + "\n";
    }
}

void DumpCommand(const Arguments& arguments, std::string& out)
{
    const std::vector<std::string>& operand = arguments.operands;
    CheckNames(operand, 1);
    ConfigFile file(operand[0], ConfigFile::Missing::kFails);
    std::vector<std::string> sections;
    if (operand.size() == 2) {
        if (!file.HasSection(operand[1])) {
            throw NotFound(file, operand[1], nullptr);
        }
        // Headers show the stored spelling, as the file has it.
        for (const std::string& stored : file.Sections()) {
            if (strcasecmp(stored.c_str(), operand[1].c_str()) == 0) {
                sections.push_back(stored);
            }
        }
        if (sections.empty()) {
            sections.push_back(operand[1]);
        }
    } else {
        // The order of a written file: the default section's keys first.
        sections = file.Sections();
        auto top = std::find(sections.begin(), sections.end(), std::string());
        if (top != sections.end()) {
            std::rotate(sections.begin(), top, top + 1);
        }
    }
    Dump(file, sections, arguments.format, out);
}

void Merge(const Arguments& arguments, std::string&)
{
    const std::vector<std::string>& operand = arguments.operands;
    std::unique_ptr<ConfigFile> other;
    if (operand[1] == "-") {
        int copy = fcntl(STDIN_FILENO, F_DUPFD_CLOEXEC, 0);
        std::FILE* stream = copy >= 0 ? fdopen(copy, "r") : nullptr;
        if (stream == nullptr) {
            int error = errno;
            if (copy >= 0) {
                close(copy);
            }
            throw Failure{kFileError, "standard input: " + SystemText(error)};
        }
        other = std::make_unique<ConfigFile>(stream, "standard input");
    } else {
        other = std::make_unique<ConfigFile>(operand[1], ConfigFile::Missing::kFails);
    }
    ConfigFile file(operand[0], ConfigFile::Missing::kReadsEmpty);
    for (const std::string& section : other->Sections()) {
        for (const auto& [key, value] : other->Entries(section)) {
            const char* found = file.Find(section, key);
            if (found != nullptr ? value != found : !arguments.existing) {
                file.Store(section, key, value);
            }
        }
    }
    file.Save(arguments.backup, arguments.verbose);
}

void Encrypt(const Arguments& arguments, std::string& out)
{
    std::string text = OperandOrLine(arguments.operands[0]);
    CheckOneLine(text, "TEXT");
    out += Encrypted(text) + "\n";
}

void Decrypt(const Arguments& arguments, std::string& out)
{
    std::string text = OperandOrLine(arguments.operands[0]);
    CheckOneLine(text, "TEXT");
    std::optional<std::string> clear = Decrypted(text);
    if (!clear) {
        throw Failure{kNotFound, "not an encrypted value"};
    }
    out += *clear + "\n";
}

}  // namespace

void RunCommand(const Arguments& arguments, std::string& out)
{
    static const struct {
        const char* name;
        void (*run)(const Arguments&, std::string&);
    } kRunners[] = {
        {"get", Get},          {"set", Set},     {"del", Del},         {"sections", Sections}, {"keys", Keys},
        {"dump", DumpCommand}, {"merge", Merge}, {"encrypt", Encrypt}, {"decrypt", Decrypt},
    };
    for (const auto& runner : kRunners) {
        if (arguments.command == runner.name) {
            runner.run(arguments, out);
        }
    }
}

}  // namespace tessaline::tools
