#include "files/scheme_tokens.h"

namespace tessaline::files {

_tokenHash g_schemeTokens[kSchemeTokenLast + 1] = {
    {"file", kSchemeFile},
    {"ftp", kSchemeFtp},
    {"http", kSchemeHttp},
};

}  // namespace tessaline::files
