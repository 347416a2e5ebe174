// The locked lookup under _GetValue and the getters, and names given as
// text for the tables' lookups without a key.
#ifndef TESSALINE_SRC_CONFIG_LOOKUP_H
#define TESSALINE_SRC_CONFIG_LOOKUP_H

#include <cstring>

#include "config/class_lock.h"
#include "tessaline/config/rvConfig.h"

namespace tessaline::config {

// A caller's name as the tables look it up: no copy, no allocation. The
// text must outlive it. Null is "".
class NameText {
public:
    explicit NameText(const char* name) : m_text(name != nullptr ? name : ""), m_length(std::strlen(m_text)) {}
    explicit NameText(const rvConfig::cfgStr& name)
        : m_text(name.c_str()), m_length(name.size()), m_fold(name.FoldHash())
    {
    }

    // The iterator of the entry in `table`, or its end().
    template <class Table>
    auto In(Table& table) const
    {
        return table.FindEntry(m_text, m_length, Fold());
    }

    // For a name asked for many times in a row, or just found.
    template <class Table>
    auto InRecent(Table& table) const
    {
        return table.FindRecent(m_text, m_length, [this] { return Fold(); });
    }

    bool empty() const { return m_length == 0; }

private:
    unsigned int Fold() const
    {
        if (m_fold == 0) {
            m_fold = FoldedNameHash(m_text, m_length);
        }
        return m_fold;
    }

    const char* m_text;
    std::size_t m_length;
    mutable unsigned int m_fold = 0;
};

// The value of `key` in `section` ("" is the current section) as the table
// holds it, or null. Nothing is counted: the caller reads it before the
// entry changes.
const rvConfig::cfgStr* PeekValue(rvConfig& config, const NameText& key, const NameText& section)
    TESSALINE_REQUIRES(g_classLock);

// _GetValue without copies of its names: 1 and the value in *value, or 0
// with *value untouched. An empty section is the current section.
unsigned int FindValue(rvConfig& config, const NameText& key, rvConfig::cfgStr* value, const NameText& section);

}  // namespace tessaline::config

#endif
