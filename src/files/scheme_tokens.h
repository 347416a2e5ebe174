// The URL schemes that the file copier tells apart, as a token table sorted
// for loose search. Private to the library.
#ifndef TESSALINE_SRC_FILES_SCHEME_TOKENS_H
#define TESSALINE_SRC_FILES_SCHEME_TOKENS_H

#include "tessaline/util/HashToken.h"

namespace tessaline::files {

enum SchemeToken { kSchemeFile = 0, kSchemeFtp = 1, kSchemeHttp = 2 };

// Rows 0 to kSchemeTokenLast: "file", "ftp", "http".
constexpr int kSchemeTokenLast = 2;
extern _tokenHash g_schemeTokens[kSchemeTokenLast + 1];

}  // namespace tessaline::files

#endif
