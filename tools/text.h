// Names and values as the configuration file can carry them, and values
// taken as lists of items.
#ifndef TESSALINE_TOOLS_TEXT_H
#define TESSALINE_TOOLS_TEXT_H

#include <string>
#include <vector>

namespace tessaline::tools {

// Throws Failure(kUsage) when `text` holds a line break or NUL: no line of
// the file can carry it. `what` names the text in the message.
void CheckOneLine(const std::string& text, const char* what);

// Throw Failure(kUsage) for a key or section name that would read back as
// something else: a key that is empty, starts a comment or section line,
// holds the delimiter or has blanks at its ends; a section name with a
// bracket, blanks at its ends or a header line longer than the reader
// takes. The section "" is the default section.
void CheckStorableKey(const std::string& key);
void CheckStorableSection(const std::string& section);

// Throws Failure(kUsage) when the line "key = value" would be longer than
// the reader takes: it would read back cut, the rest as a line of its own.
void CheckLineLength(const std::string& key, const std::string& carriedValue);

// The text to store so that the reader gives back exactly `value`: the
// reader trims values, removes one pair of quotes and forgets a key whose
// value is empty, so such values are stored in quotes.
std::string Carried(const std::string& value);

// The items of a list value: split at the separator with the blanks around
// it not counting (a separator of blanks alone splits at runs of blanks),
// each item trimmed, empty items left out.
std::vector<std::string> ListItems(const std::string& value, const std::string& separator);

// Joins items with the separator.
std::string JoinItems(const std::vector<std::string>& items, const std::string& separator);

}  // namespace tessaline::tools

#endif
