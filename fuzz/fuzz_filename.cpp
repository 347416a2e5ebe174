// rvFilename on arbitrary text: construction, assignment, Split, Join, every
// accessor and setter, comparison, and the slash translators in both forms.
// Arguments are drawn from the input, from null, from the object's own
// components and from inside its own text, since the header allows all of
// them. Beyond "no crash" it checks that accessors never return null, that
// the recovered parts point into the object's text, and what the
// translators promise.
#include <fuzzer/FuzzedDataProvider.h>

#include <string.h>

#include <string>
#include <deque>

#include "fuzz_check.h"
#include "tessaline/files/rvFilename.h"

namespace {

constexpr size_t kTranslateLimit = 4095;
constexpr size_t kLongText = 4200;

// Text from the input; now and then repeated past the working limits of
// 4096 bytes, which short fuzzer inputs would otherwise rarely reach (not
// always: long texts slow every step down).
std::string TakeText(FuzzedDataProvider& input)
{
    std::string text = input.ConsumeRandomLengthString(512);
    if (input.ConsumeIntegralInRange(0, 7) == 0 && !text.empty()) {
        std::string longText;
        while (longText.size() < kLongText)
            longText += text;
        text = longText;
    }
    return text;
}

// An argument: null, fresh text, one of the object's own components, or a
// pointer into its own text.
const char* TakeArgument(FuzzedDataProvider& input, rvFilename& name, std::deque<std::string>& keep)
{
    switch (input.ConsumeIntegralInRange(0, 4)) {
    case 0:
        return nullptr;
    case 1:
        keep.push_back(TakeText(input));
        return keep.back().c_str();
    case 2: {
        char* fields[] = {name.m_pScheme, name.m_pServer, name.m_pDirectory, name.m_pFile, name.m_pExt};
        return fields[input.ConsumeIntegralInRange(0, 4)];
    }
    default: {
        const char* text = name();
        return text + input.ConsumeIntegralInRange<size_t>(0, strlen(text));
    }
    }
}

bool PointsInto(const char* part, const char* text)
{
    return part >= text && part <= text + strlen(text);
}

// Setters and Join can grow the text to five times the working limit.
// Recovering a part searches the text for a rebuilt copy of itself with
// strstr, whose time on such long periodic text grows with the square of
// its length; so long texts are searched at the end of a run only.
constexpr size_t kSearchEveryStepUpTo = 2 * 4096;

void CheckObject(rvFilename& name, bool last)
{
    for (const char* part : {name.Scheme(), name.Server(), name.FullDirectory(), name.Directory(), name.File(),
                             name.Ext(), name(), static_cast<const char*>(name)}) {
        FUZZ_CHECK(part != nullptr);
        (void)strlen(part);
    }
    if (last || strlen(name()) <= kSearchEveryStepUpTo) {
        for (const char* part : {name.URL(), name.Pathname(), name.Filename(), name.LocalPath()}) {
            FUZZ_CHECK(part != nullptr);
            FUZZ_CHECK(*part == '\0' || PointsInto(part, name()));
        }
    }
    // Every way of changing the text ends by turning backslashes into "/",
    // over the first 4095 characters.
    const char* path = name();
    for (size_t i = 0; i < kTranslateLimit && path[i]; ++i)
        FUZZ_CHECK(path[i] != '\\');
    FUZZ_CHECK(name == name);
    FUZZ_CHECK(!(name < name) || name.m_pPath == nullptr);
    (void)name.IsURL();
    (void)name.IsDirectory();
    (void)name.Empty(nullptr);
}

void CheckTextTranslators(const std::string& text)
{
    std::string unix = text;
    rvFilename::XlatPathToUNIX(unix.data());
    std::string normal = text;
    rvFilename::NormalizePath(normal.data());
    FUZZ_CHECK(unix == normal);
    std::string dos = text;
    rvFilename::XlatPathToDOS(dos.data());

    // The DOS form starts behind "://" and the slashes that follow it.
    const size_t length = strlen(text.c_str());
    size_t dosStart = 0;
    if (const char* separator = strstr(text.c_str(), "://")) {
        dosStart = static_cast<size_t>(separator - text.c_str()) + 3;
        while (text[dosStart] == '/')
            ++dosStart;
    }
    for (size_t i = 0; i < text.size(); ++i) {
        const bool toUnix = i < length && i < kTranslateLimit;
        const bool toDos = i < length && i >= dosStart && i - dosStart < kTranslateLimit;
        FUZZ_CHECK(unix[i] == (toUnix && text[i] == '\\' ? '/' : text[i]));
        FUZZ_CHECK(dos[i] == (toDos && text[i] == '/' ? '\\' : text[i]));
    }
}

void CheckRopeTranslators(const std::string& text)
{
    rvFilename::rope unix(text.data(), text.size());
    rvFilename::XlatPathToUNIX(unix);
    rvFilename::rope dos(text.data(), text.size());
    rvFilename::XlatPathToDOS(dos);
    rvFilename::rope normal(text.data(), text.size());
    rvFilename::NormalizePath(normal);
    FUZZ_CHECK(unix.size() == text.size() && dos.size() == text.size());
    FUZZ_CHECK(unix == normal);
    for (size_t i = 0; i < text.size(); ++i) {
        FUZZ_CHECK(unix[i] == (text[i] == '\\' ? '/' : text[i]));
        FUZZ_CHECK(dos[i] == (text[i] == '/' ? '\\' : text[i]));
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    FuzzedDataProvider input(data, size);
    const std::string first = TakeText(input);
    const bool startEmpty = input.ConsumeBool();
    rvFilename name(startEmpty ? nullptr : first.c_str(), input.ConsumeIntegralInRange(0u, 1u));
    CheckObject(name, false);

    for (int step = 0; step < 16 && input.remaining_bytes() > 0; ++step) {
        std::deque<std::string> keep;  // stable addresses
        switch (input.ConsumeIntegralInRange(0, 9)) {
        case 0:
            name.Split(TakeArgument(input, name, keep));
            break;
        case 1: {
            const char* scheme = TakeArgument(input, name, keep);
            const char* server = TakeArgument(input, name, keep);
            const char* directory = TakeArgument(input, name, keep);
            const char* file = TakeArgument(input, name, keep);
            const char* ext = TakeArgument(input, name, keep);
            const char* joined = name.Join(scheme, server, directory, file, ext);
            FUZZ_CHECK(joined != nullptr);
            break;
        }
        case 2: {
            const char* text = TakeArgument(input, name, keep);
            switch (input.ConsumeIntegralInRange(0, 4)) {
            case 0:
                name.Scheme(text);
                break;
            case 1:
                name.Server(text);
                break;
            case 2:
                name.Directory(text);
                break;
            case 3:
                name.File(text);
                break;
            default:
                name.Ext(text);
                break;
            }
            break;
        }
        case 3:
            name = TakeArgument(input, name, keep);
            break;
        case 4: {
            rvFilename copy(name);
            CheckObject(copy, false);
            FUZZ_CHECK(copy == name);
            name = copy;
            break;
        }
        case 5: {
            keep.push_back(TakeText(input));
            rvFilename other(keep.back().c_str(), 1);
            CheckObject(other, false);
            const int equal = name == other;
            FUZZ_CHECK(equal == (other == name));
            FUZZ_CHECK(!equal || !(name < other) || name.m_pPath == nullptr);
            (void)(other < name);
            break;
        }
        case 6:
            (void)name.Exists(input.ConsumeIntegralInRange(0, 7));
            (void)name.Empty(TakeArgument(input, name, keep));
            break;
        case 7:
            name.Clear();
            break;
        case 8: {
            const std::string text = TakeText(input);
            CheckTextTranslators(text);
            CheckRopeTranslators(text);
            break;
        }
        default:
            (void)rvFilename::IsDirectory(TakeArgument(input, name, keep));
            break;
        }
        CheckObject(name, false);
    }
    CheckObject(name, true);
    return 0;
}
