// A cfgStr that refers to a caller's text for the length of one lookup,
// without copying it or allocating. The lookups of the `const char*` entry
// points spend most of their time allocating two ropes that are gone again
// at the end of the call; a borrowed name serves for finding and erasing.
//
// It must never be stored: a copy of it (in a table, in m_strSection)
// would outlive the text. Only pass it where a name is compared.
#ifndef TESSALINE_SRC_CONFIG_BORROWED_NAME_H
#define TESSALINE_SRC_CONFIG_BORROWED_NAME_H

#include <cstring>
#include <new>

#include "tessaline/config/rvConfig.h"

namespace tessaline::config {

class BorrowedName : public rvConfig::cfgStr {
public:
    // Null and "" give the empty name, as for a cfgStr.
    explicit BorrowedName(const char* text)
    {
        if (text == nullptr || *text == '\0') {
            return;
        }
        // The leaf points at the caller's characters. Its count starts at
        // two, one of which is never released, so no copy made during the
        // lookup can bring it to zero and free the caller's text.
        _RopeLeaf* leaf =
            ::new (static_cast<void*>(m_leaf)) _RopeLeaf(const_cast<char*>(text), std::strlen(text), get_allocator());
        leaf->_M_ref_count = 2;
        this->_M_tree_ptr = leaf;
    }

    // The leaf is dropped without its destructor, which would free the
    // caller's text; its locks are statically initialised and need no
    // destruction.
    ~BorrowedName() { this->_M_tree_ptr = nullptr; }

    BorrowedName(const BorrowedName&) = delete;
    BorrowedName& operator=(const BorrowedName&) = delete;

private:
    alignas(_RopeLeaf) unsigned char m_leaf[sizeof(_RopeLeaf)];
};

}  // namespace tessaline::config

#endif
