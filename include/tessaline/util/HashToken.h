/**
 * @file
 * @brief Token tables: words mapped to numbers, ignoring case.
 *
 * A word is looked up in a constant table of word and value pairs. The table
 * is walked; nothing is hashed.
 *
 * A table is an array of _tokenHash rows. Exact search takes them in any
 * order. Loose search, where a row's name need only be a prefix of the
 * token, needs the rows in ascending order of name by _stricmp: then the
 * longest name that is a prefix of the token wins.
 *
 * Ownership: rows only point at their names; the table's owner keeps both
 * alive. Thread safety: lookups only read, so a table that nothing writes
 * may be shared freely.
 *
 * Typical use:
 * @code
 *   _tokenHash kColours[] = {{"blue", 1}, {"green", 2}, {"red", 3}};
 *   int colour = HashToken(word, kColours, 2, 0, 1);  // -1 if unknown
 * @endcode
 */
#ifndef TESSALINE_UTIL_HASHTOKEN_H
#define TESSALINE_UTIL_HASHTOKEN_H

#include <cstring>

#include "tessaline/export.h"
#include "tessaline/util/rvString.h"

/// One row of a token table: a word and the value a match gives.
struct _tokenHash {
    const char* name;  ///< The word; not owned, and not null in a searched range.
    int value;         ///< What a match gives; -1 is reserved for "no match".

    /// Predicate of loose search.
    struct LooseFindPred {
        /// True if the row's name is a prefix of `token`, ignoring case.
        bool operator()(const _tokenHash& row, const char* token) const
        {
            return _strnicmp(row.name, token, static_cast<unsigned>(std::strlen(row.name))) == 0;
        }
    };

    /// Ordering of loose search, for a binary search over a sorted table.
    struct loose_sort {
        /// True if the key's name sorts before the row's name when only as
        /// many characters as the row's name has are compared.
        bool operator()(const _tokenHash& key, const _tokenHash& row) const
        {
            return _strnicmp(key.name, row.name, static_cast<unsigned>(std::strlen(row.name))) < 0;
        }
    };

    /// Rows are equal when their names are, ignoring case; values play no part.
    bool operator==(const _tokenHash& other) const { return _stricmp(name, other.name) == 0; }
};

/// Looks `token` up in the rows `low` to `high` of `table`, both included,
/// and returns the value of the matching row, or -1.
///
/// With `exact` not 0 the token must equal a row's name; of several equal
/// names the first wins. With `exact` 0 a row matches when its name is a
/// prefix of the token (so "httpx" matches "http", and an empty name matches
/// everything); of several matches in a sorted table the last wins, which is
/// the longest name. In a table that isn't sorted, loose search gives the
/// value of some matching row or -1, and never reads outside the range.
///
/// A null `token` or `table`, a negative `low` or a `high` below `low` gives
/// -1. The names in the range must not be null.
TESSALINE_API int HashToken(const char* token, _tokenHash* table, int high, int low, unsigned int exact);

#endif
