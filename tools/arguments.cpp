#include "arguments.h"

#include "failure.h"

namespace tessaline::tools {

const char kUsageText[] =
    "usage: tessaline-config get FILE SECTION KEY [--default TEXT] [--decrypt]\n"
    "       tessaline-config set FILE SECTION KEY VALUE|- [--encrypt] [--existing] [--backup]\n"
    "                        [--list [--list-sep STR]]\n"
    "       tessaline-config del FILE SECTION [KEY [ITEM --list [--list-sep STR]]] [--existing]\n"
    "       tessaline-config sections FILE\n"
    "       tessaline-config keys FILE SECTION\n"
    "       tessaline-config dump FILE [SECTION] [--format ini|json|sh|lines]\n"
    "       tessaline-config merge FILE OTHER|- [--existing] [--backup]\n"
    "       tessaline-config encrypt TEXT|-\n"
    "       tessaline-config decrypt TEXT|-\n"
    "       tessaline-config --help | --version\n"
    "set, del and merge also take --verbose. SECTION \"\" is the section above the\n"
    "first section line. Exit status: 0 done, 1 not found, 2 usage error,\n"
    "3 the file could not be read or written. See tessaline-config(1).\n";

namespace {

enum Option : unsigned {
    kDefault = 1U << 0,
    kDecrypt = 1U << 1,
    kEncrypt = 1U << 2,
    kExisting = 1U << 3,
    kBackup = 1U << 4,
    kList = 1U << 5,
    kListSep = 1U << 6,
    kFormat = 1U << 7,
    kVerbose = 1U << 8,
};

struct CommandRule {
    const char* name;
    std::size_t minOperands;
    std::size_t maxOperands;
    unsigned options;
    const char* synopsis;
};

constexpr CommandRule kCommands[] = {
    {"get", 3, 3, kDefault | kDecrypt, "get FILE SECTION KEY"},
    {"set", 4, 4, kEncrypt | kExisting | kBackup | kList | kListSep | kVerbose, "set FILE SECTION KEY VALUE|-"},
    {"del", 2, 4, kExisting | kList | kListSep | kVerbose, "del FILE SECTION [KEY [ITEM --list]]"},
    {"sections", 1, 1, 0, "sections FILE"},
    {"keys", 2, 2, 0, "keys FILE SECTION"},
    {"dump", 1, 2, kFormat, "dump FILE [SECTION]"},
    {"merge", 2, 2, kExisting | kBackup | kVerbose, "merge FILE OTHER|-"},
    {"encrypt", 1, 1, 0, "encrypt TEXT|-"},
    {"decrypt", 1, 1, 0, "decrypt TEXT|-"},
};

struct OptionRule {
    const char* name;
    Option option;
    std::string* value;  // null for a flag
    bool* flag;
};

Failure Usage(const std::string& message)
{
    return Failure{kUsage, message + " (try --help)"};
}

const CommandRule& FindCommand(const std::string& word)
{
    for (const CommandRule& rule : kCommands) {
        if (word == rule.name) {
            return rule;
        }
    }
    throw Usage(word.empty() ? std::string("no command") : "unknown command '" + word + "'");
}

}  // namespace

Arguments ParseArguments(int argc, char** argv)
{
    Arguments arguments;
    if (argc < 2) {
        throw Usage("no command");
    }
    arguments.command = argv[1];
    if (arguments.command == "--help" || arguments.command == "--version") {
        if (argc > 2) {
            throw Usage(arguments.command + " takes no arguments");
        }
        return arguments;
    }
    const CommandRule& rule = FindCommand(arguments.command);

    std::string defaultText;
    const OptionRule options[] = {
        {"default", kDefault, &defaultText, nullptr},
        {"decrypt", kDecrypt, nullptr, &arguments.decrypt},
        {"encrypt", kEncrypt, nullptr, &arguments.encrypt},
        {"existing", kExisting, nullptr, &arguments.existing},
        {"backup", kBackup, nullptr, &arguments.backup},
        {"list", kList, nullptr, &arguments.list},
        {"list-sep", kListSep, &arguments.listSeparator, nullptr},
        {"format", kFormat, &arguments.format, nullptr},
        {"verbose", kVerbose, nullptr, &arguments.verbose},
    };
    bool optionsEnded = false;
    bool separatorGiven = false;
    for (int i = 2; i < argc; ++i) {
        std::string word = argv[i];
        if (!optionsEnded && word == "--") {
            optionsEnded = true;
            continue;
        }
        if (optionsEnded || word.compare(0, 2, "--") != 0) {
            arguments.operands.push_back(word);
            continue;
        }
        std::string::size_type equals = word.find('=');
        std::string name = word.substr(2, equals == std::string::npos ? std::string::npos : equals - 2);
        const OptionRule* found = nullptr;
        for (const OptionRule& option : options) {
            if (name == option.name) {
                found = &option;
            }
        }
        if (found == nullptr) {
            throw Usage("unknown option '--" + name + "'");
        }
        if ((rule.options & found->option) == 0) {
            throw Usage(arguments.command + " does not take --" + name);
        }
        if (found->flag != nullptr) {
            if (equals != std::string::npos) {
                throw Usage("--" + name + " takes no value");
            }
            *found->flag = true;
            continue;
        }
        if (equals != std::string::npos) {
            *found->value = word.substr(equals + 1);
        } else if (i + 1 < argc) {
            *found->value = argv[++i];
        } else {
            throw Usage("--" + name + " needs a value");
        }
        if (found->option == kDefault) {
            arguments.defaultText = defaultText;
        }
        separatorGiven = separatorGiven || found->option == kListSep;
    }

    std::size_t count = arguments.operands.size();
    if (count < rule.minOperands || count > rule.maxOperands) {
        throw Usage(std::string(count < rule.minOperands ? "missing" : "too many") + " arguments: tessaline-config " +
                    rule.synopsis);
    }
    if (arguments.command == "del" && arguments.list != (count == 4)) {
        throw Usage("del takes ITEM together with --list");
    }
    if (separatorGiven && !arguments.list) {
        throw Usage("--list-sep needs --list");
    }
    if (arguments.list && arguments.listSeparator.empty()) {
        throw Usage("--list-sep must not be empty");
    }
    const char* const formats[] = {"ini", "json", "sh", "lines"};
    bool knownFormat = false;
    for (const char* format : formats) {
        knownFormat = knownFormat || arguments.format == format;
    }
    if (!knownFormat) {
        throw Usage("unknown format '" + arguments.format + "'");
    }
    return arguments;
}

}  // namespace tessaline::tools
