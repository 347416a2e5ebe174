// The locked lookup under _GetValue and the getters, and names given as
// text for the tables' lookups without a key.
#ifndef TESSALINE_SRC_CONFIG_LOOKUP_H
#define TESSALINE_SRC_CONFIG_LOOKUP_H

#include <cstring>

#include "tessaline/config/rvConfig.h"

namespace tessaline::config {

// A caller's name as the tables look it up: no copy, no allocation. The
// text must outlive it. Null is "".
struct NameText {
    explicit NameText(const char* name)
        : text(name != nullptr ? name : ""), length(std::strlen(text)), fold(FoldedNameHash(text, length))
    {
    }
    explicit NameText(const rvConfig::cfgStr& name) : text(name.c_str()), length(name.size()), fold(name.FoldHash()) {}

    template <class Table>
    typename Table::value_type* In(const Table& table) const
    {
        return table.FindEntry(text, length, fold);
    }

    bool empty() const { return length == 0; }

    const char* text;
    std::size_t length;
    unsigned int fold;
};

// _GetValue without copies of its names: 1 and the value in *value, or 0
// with *value untouched. An empty section is the current section.
unsigned int FindValue(rvConfig& config, const NameText& key, rvConfig::cfgStr* value, const NameText& section);

}  // namespace tessaline::config

#endif
