// Exact and loose lookup in token tables.
#include <algorithm>
#include <cstring>

#include "tessaline/util/HashToken.h"

namespace tessaline::util {
namespace {

int ExactSearch(const char* token, const _tokenHash* first, const _tokenHash* last)
{
    // The walk stops on the last row at the latest, and that row is tested
    // like every other.
    const _tokenHash* row = first;
    while (row != last && _stricmp(row->name, token) != 0) {
        ++row;
    }
    return _stricmp(row->name, token) == 0 ? row->value : -1;
}

int LooseSearch(const char* token, _tokenHash* first, _tokenHash* end)
{
    const _tokenHash::LooseFindPred isPrefix;
    _tokenHash* const start = std::find_if(first, end, [&](const _tokenHash& row) { return isPrefix(row, token); });
    if (start == end) {
        return -1;
    }
    // In a sorted table the rows that can still match lie between the first
    // match and the first row that sorts after the token.
    const _tokenHash key = {token, 0};
    _tokenHash* const stop = std::upper_bound(start, end, key, _tokenHash::loose_sort());
    int value = -1;
    for (_tokenHash* row = start; row != stop; ++row) {
        const int order = _strnicmp(row->name, token, static_cast<unsigned>(std::strlen(row->name)));
        if (order > 0) {
            break;
        }
        if (order == 0) {
            value = row->value;
        }
    }
    return value;
}

}  // namespace
}  // namespace tessaline::util

using tessaline::util::ExactSearch;
using tessaline::util::LooseSearch;

int HashToken(const char* token, _tokenHash* table, int high, int low, unsigned int exact)
{
    if (token == nullptr || table == nullptr || low < 0 || high < low) {
        return -1;
    }
    if (exact != 0) {
        return ExactSearch(token, table + low, table + high);
    }
    return LooseSearch(token, table + low, table + high + 1);
}
