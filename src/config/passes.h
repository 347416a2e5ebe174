// What the reading and the writing pass share: the line buffer and the
// classification of a trimmed line.
#ifndef TESSALINE_SRC_CONFIG_PASSES_H
#define TESSALINE_SRC_CONFIG_PASSES_H

#include <cstdio>

#include "config/class_lock.h"
#include "tessaline/config/rvConfig.h"

namespace tessaline::config {

constexpr int kLineBufferSize = 4096;
// The fgets limit: at most 4094 bytes of the file per line.
constexpr int kLineLimit = 4095;

// The UTF-8 byte order mark that editors on other systems put first.
constexpr char kByteOrderMark[] = "\xEF\xBB\xBF";

// Reads the next line (or 4094-byte piece) into `line`; false at the end of
// the file, on a read error, or for a null stream.
bool ReadLine(FILE* stream, char* line);

// Takes a byte order mark off the start of the file's first line, in place;
// true when there was one. Anywhere else the three bytes are text.
bool SkipByteOrderMark(char* line);

// Whether the reading of `stream` stopped at a read error rather than at its
// end. A stream open for writing only (OpenWrite) has no lines to give, and
// its refused reads are no error.
bool ReadFailed(FILE* stream);

// Classes of a trimmed, non-empty line; a line that is neither is a key line.
bool IsCommentLine(const char* text);
bool IsSectionLine(const char* text);

// The name on a section line, trimmed in place: the first run without
// bracket characters. A line made only of brackets gives "".
char* SectionName(rvConfig& config, char* text);

// The trimmed key of a key line, after skipping delimiters at its start;
// *rest is the text behind the delimiter, or null when there is none.
char* KeyOfLine(rvConfig& config, char* text, char** rest);

// The passes of Serialize. The writing pass consumes the tables; 1 when
// the file was replaced as asked.
void ReadPass(rvConfig& config) TESSALINE_REQUIRES(g_classLock);
unsigned int WritePass(rvConfig& config) TESSALINE_REQUIRES(g_classLock);

}  // namespace tessaline::config

#endif
