#include "secret.h"

#include <tessaline/crypt/rvEncrypt.h>

#include <algorithm>
#include <cctype>
#include <vector>

#include "failure.h"

namespace tessaline::tools {

namespace {

// Text of the chained form is exactly this many hexadecimal digits.
constexpr std::size_t kChainedLength = 80;
// rvDecrypt needs this much room for the chained form.
constexpr std::size_t kChainedCapacity = 37;

}  // namespace

std::string Encrypted(const std::string& clear)
{
    std::vector<unsigned char> data(clear.begin(), clear.end());
    std::size_t blocks = ((clear.size() + 3) >> 4) + 1;
    std::vector<char> out(32 * blocks + 5);
    if (rvEncrypt(data.data(), data.size(), out.data()) == 0) {
        throw Failure{kUsage, "the value is too long to encrypt"};
    }
    return out.data();
}

std::optional<std::string> Decrypted(const std::string& text)
{
    if (text.empty()) {
        return std::string();
    }
    bool chained = text.size() == kChainedLength &&
                   std::all_of(text.begin(), text.end(), [](unsigned char c) { return std::isxdigit(c) != 0; });
    std::string input = text;
    std::vector<unsigned char> out(std::max(text.size() / 2, kChainedCapacity));
    unsigned long length = out.size();
    unsigned int wasPlain = 1;
    if (rvDecrypt(input.data(), out.data(), &length, &wasPlain) == 0 || (wasPlain != 0 && !chained)) {
        return std::nullopt;
    }
    return std::string(out.begin(), out.begin() + static_cast<std::ptrdiff_t>(length));
}

}  // namespace tessaline::tools
