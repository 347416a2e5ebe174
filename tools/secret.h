// Values in the library's encrypted text form.
#ifndef TESSALINE_TOOLS_SECRET_H
#define TESSALINE_TOOLS_SECRET_H

#include <optional>
#include <string>

namespace tessaline::tools {

// The marked text form of `clear` ("" stays ""). Throws Failure(kUsage) for
// a value too long for the cipher.
std::string Encrypted(const std::string& clear);

// The clear text of marked or chained text ("" gives ""); nothing for any
// other text. Only text of 80 hexadecimal digits counts as chained, so that
// a clear value that merely has 80 characters is not taken for a secret.
std::optional<std::string> Decrypted(const std::string& text);

}  // namespace tessaline::tools

#endif
