// cfgStr: one block per text, counted atomically, or a rope's text held by
// a block of the library's own so that copies never touch the rope's lock.
#include <cstdlib>
#include <cstring>
#include <new>

#include "tessaline/config/rvConfig.h"

struct rvConfig::cfgStr::RopeText : Text {
    explicit RopeText(const __gnu_cxx::crope& text) : rope(text), chars(rope.c_str()) {}
    __gnu_cxx::crope rope;
    const char* chars;
};

namespace {

// Lengths above this would collide with the rope mark.
constexpr std::size_t kLongestText = 0x7fffffffu;

}  // namespace

rvConfig::cfgStr::cfgStr(const char* text) : cfgStr(text, text != nullptr ? std::strlen(text) : 0) {}

rvConfig::cfgStr::cfgStr(const char* text, std::size_t length)
{
    if (text == nullptr) {
        return;
    }
    length = strnlen(text, length);
    if (length == 0) {
        return;
    }
    if (length > kLongestText) {
        throw std::bad_alloc();
    }
    void* block = std::malloc(sizeof(Text) + length + 1);
    if (block == nullptr) {
        throw std::bad_alloc();
    }
    Text* shared = ::new (block) Text{{1}, static_cast<unsigned int>(length), {0}};
    Adopt(shared);
    char* chars = reinterpret_cast<char*>(shared + 1);
    std::memcpy(chars, text, length);
    chars[length] = '\0';
}

rvConfig::cfgStr::cfgStr(const __gnu_cxx::crope& text)
{
    if (text.empty()) {
        return;
    }
    RopeText* shared = new RopeText(text);
    const std::size_t length = std::strlen(shared->chars);
    if (length == 0 || length > kLongestText) {
        delete shared;
        if (length != 0) {
            throw std::bad_alloc();
        }
        return;
    }
    shared->refs.store(1, std::memory_order_relaxed);
    shared->length = static_cast<unsigned int>(length) | kRopeText;
    shared->foldHash.store(0, std::memory_order_relaxed);
    Adopt(shared);
}

rvConfig::cfgStr::operator __gnu_cxx::crope() const
{
    const Text* text = Get();
    if (text == nullptr) {
        return __gnu_cxx::crope();
    }
    if ((text->length & kRopeText) != 0) {
        return static_cast<const RopeText*>(text)->rope;
    }
    return __gnu_cxx::crope(c_str(), size());
}

void rvConfig::cfgStr::Free(Text* text) noexcept
{
    if ((text->length & kRopeText) != 0) {
        delete static_cast<RopeText*>(text);
        return;
    }
    text->~Text();
    std::free(text);
}

const char* rvConfig::cfgStr::RopeChars(const Text* text) noexcept
{
    return static_cast<const RopeText*>(text)->chars;
}

unsigned int rvConfig::cfgStr::StoreFoldHash(Text* text) noexcept
{
    const bool rope = (text->length & kRopeText) != 0;
    const char* chars = rope ? RopeChars(text) : reinterpret_cast<const char*>(text + 1);
    const unsigned int fold = tessaline::config::FoldedNameHash(chars, text->length & ~kRopeText);
    text->foldHash.store(fold, std::memory_order_relaxed);
    return fold;
}
