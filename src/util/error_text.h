// The text of a platform error code, for every message and error text the
// library gives.
#ifndef TESSALINE_SRC_UTIL_ERROR_TEXT_H
#define TESSALINE_SRC_UTIL_ERROR_TEXT_H

namespace tessaline::util {

// What strerror(code) gives, without strerror's shared buffer: the text of
// an unknown code is formed in a buffer of the calling thread, valid until
// that thread's next call. Never null.
const char* ErrorText(int code);

}  // namespace tessaline::util

#endif
