/**
 * @file
 * @brief NameTable: the hash table of rvConfig's sections and keys.
 */
/**
 * @class tessaline::config::NameTable
 * @brief A map from case-insensitive names to values, in the classic
 * extension hash_map's order, found in constant time whatever the names.
 *
 * The entries stand in singly ordered bucket chains exactly as in the
 * extension hash_map: the bucket of a name is BucketHash modulo the bucket
 * count; a new entry goes to the head of its chain; the table grows before
 * every insertion to the first prime of the classic list not below size + 1
 * (193 buckets to start), moving the old chains from bucket 0 upward, head to
 * tail, to the heads of their new chains; removal leaves the others alone and
 * the table never shrinks. Iteration walks the buckets upward and each chain
 * from its head, which is the order rvConfig enumerates and writes in.
 *
 * Lookups do not walk the chains, which a file of names that agree in the
 * bytes BucketHash reads would make long: a second index on a seeded hash of
 * the whole case-folded name finds the one entry to compare. Where the
 * calling thread's locale folds more than A-Z (or names were stored under
 * such a locale), lookups walk the chain and compare as Equal does, so the
 * entry found is always the one the chain would give.
 *
 * Entries never move: iterators, pointers and references to entries stay
 * valid until their entry is erased or the table cleared, also across
 * growth. Copies keep the bucket count and the order of every chain.
 *
 * Thread safety: none of its own; rvConfig guards its tables with its class
 * lock. Distinct tables may be used by distinct threads.
 *
 * Key must be `const N` for a name type N with `c_str()` (NUL-terminated),
 * `size()` (its length) and `FoldHash()` (FoldedNameHash of its text, which
 * N may cache). BucketHash must also hash a text given as (pointer, length).
 */
#ifndef TESSALINE_CONFIG_NAMETABLE_H
#define TESSALINE_CONFIG_NAMETABLE_H

#include <atomic>
#include <algorithm>
#include <cstddef>
#include <cstring>
#include <iterator>
#include <new>
#include <strings.h>
#include <tuple>
#include <type_traits>
#include <utility>

#include "tessaline/export.h"

namespace tessaline::config {

/// A hash of `length` bytes of `text` folded to lower case for A-Z only,
/// keyed with a random per-process secret (SipHash-1-3), so that names cannot
/// be chosen to collide. The top bit is always set; 0 is never a result.
TESSALINE_API unsigned int FoldedNameHash(const char* text, std::size_t length) noexcept;

/// True when the calling thread's locale folds case for A-Z and nothing
/// else, as "C", "POSIX" and the UTF-8 locales do: strcasecmp then equals two
/// names exactly when their A-Z folded texts are equal.
TESSALINE_API bool AsciiCaseFolding() noexcept;

/// Whether `a` and `b` are equal with A-Z folded to lower case.
TESSALINE_API bool AsciiFoldedEqual(const char* a, const char* b) noexcept;

/// Whether the `length` bytes at `a` and at `b` are equal with A-Z folded to
/// lower case. Inline: the tables' lookups end in it.
inline bool AsciiFoldedEqual(const char* a, const char* b, std::size_t length) noexcept
{
    for (std::size_t i = 0; i < length; ++i) {
        const unsigned int x = static_cast<unsigned char>(a[i]);
        const unsigned int y = static_cast<unsigned char>(b[i]);
        if (x != y && ((x ^ y) != 0x20 || (x | 0x20) < 'a' || (x | 0x20) > 'z')) {
            return false;
        }
    }
    return true;
}

/// The classic extension hash_map's bucket counts: the first not below
/// `wanted`, or the largest.
TESSALINE_API std::size_t NextBucketCount(std::size_t wanted) noexcept;

/// Asks for a copy that shares its names and values without counting the
/// references: it must be gone before the original's entries go or change.
/// Flush works on such a copy so that the table it gives back is the one it
/// took, untouched.
struct BorrowingCopy {};

template <class Key, class Mapped, class BucketHash, class Equal>
class NameTable {
    struct Node;

public:
    /// The names a host's code spells the table's types with.
    ///@{
    typedef Key key_type;
    typedef Mapped data_type;
    typedef Mapped mapped_type;
    typedef std::pair<Key, Mapped> value_type;
    typedef std::size_t size_type;
    typedef std::ptrdiff_t difference_type;
    typedef value_type& reference;
    typedef const value_type& const_reference;
    typedef value_type* pointer;
    typedef const value_type* const_pointer;
    typedef BucketHash hasher;
    typedef Equal key_equal;
    ///@}

    /// Walks the entries in bucket order, each chain from its head; the
    /// const form when IsConst. Valid while its entry stays in the table.
    template <bool IsConst>
    class basic_iterator {
    public:
        /// A forward iterator's traits.
        ///@{
        typedef std::forward_iterator_tag iterator_category;
        typedef typename NameTable::value_type value_type;
        typedef std::ptrdiff_t difference_type;
        typedef std::conditional_t<IsConst, const value_type, value_type>* pointer;
        typedef std::conditional_t<IsConst, const value_type, value_type>& reference;
        ///@}

        /// Stands on no table; only assignment and comparison are defined.
        basic_iterator() = default;
        /// A const iterator from a mutable one.
        template <bool WasConst, class = std::enable_if_t<IsConst && !WasConst>>
        basic_iterator(const basic_iterator<WasConst>& other) : m_node(other.m_node), m_table(other.m_table)
        {
        }

        /// The entry; the next in bucket order; whether two stand on one entry.
        ///@{
        reference operator*() const { return m_node->value; }
        pointer operator->() const { return &m_node->value; }
        basic_iterator& operator++()
        {
            m_node = m_table->NextNode(m_node);
            return *this;
        }
        basic_iterator operator++(int)
        {
            basic_iterator old = *this;
            ++*this;
            return old;
        }
        friend bool operator==(const basic_iterator& a, const basic_iterator& b) { return a.m_node == b.m_node; }
        friend bool operator!=(const basic_iterator& a, const basic_iterator& b) { return a.m_node != b.m_node; }
        ///@}

    private:
        friend class NameTable;
        template <bool>
        friend class basic_iterator;
        basic_iterator(Node* node, const NameTable* table) : m_node(node), m_table(table) {}
        Node* m_node = nullptr;
        const NameTable* m_table = nullptr;
    };
    /// The mutable and the const iterator.
    ///@{
    typedef basic_iterator<false> iterator;
    typedef basic_iterator<true> const_iterator;
    ///@}

    /// Empty, with room for `hint` entries before growing (193 buckets for
    /// the default hint of 100).
    explicit NameTable(size_type hint = 100) { m_bucketCount = NextBucketCount(hint); }
    /// A copy with the same bucket count and the same order in every chain.
    NameTable(const NameTable& other) : m_bucketCount(other.m_bucketCount) { CopyFrom(other, Counted()); }
    /// A copy whose entries borrow those of `other` (see BorrowingCopy).
    NameTable(const NameTable& other, BorrowingCopy borrowing) : m_bucketCount(other.m_bucketCount)
    {
        CopyFrom(other, borrowing);
    }
    /// Takes `other`'s entries and leaves it empty.
    NameTable(NameTable&& other) noexcept : m_bucketCount(NextBucketCount(100)) { swap(other); }
    /// Becomes a copy of `other`, as the copy constructor makes it.
    NameTable& operator=(const NameTable& other)
    {
        if (this != &other) {
            NameTable copy(other);
            swap(copy);
        }
        return *this;
    }
    /// Takes `other`'s entries and leaves it empty.
    NameTable& operator=(NameTable&& other) noexcept
    {
        NameTable gone(std::move(other));
        swap(gone);
        return *this;
    }
    ~NameTable() { Release(); }

    /// The number of entries, whether there are none, the most there can be,
    /// the bucket count, and the hash and equality objects.
    ///@{
    size_type size() const { return m_size; }
    bool empty() const { return m_size == 0; }
    size_type max_size() const { return size_type(-1) / sizeof(Node); }
    size_type bucket_count() const { return m_bucketCount; }
    hasher hash_funct() const { return hasher(); }
    key_equal key_eq() const { return key_equal(); }
    ///@}

    /// The first entry in bucket order, and the end.
    ///@{
    iterator begin() { return iterator(FirstNode(), this); }
    iterator end() { return iterator(); }
    const_iterator begin() const { return const_iterator(FirstNode(), this); }
    const_iterator end() const { return const_iterator(); }
    ///@}

    /// The entry whose name equals `name` without regard to case, or end();
    /// count() is 1 or 0.
    ///@{
    iterator find(const key_type& name) { return iterator(FindNode(name), this); }
    const_iterator find(const key_type& name) const { return const_iterator(FindNode(name), this); }
    iterator find(const char* name) { return iterator(FindText(name), this); }
    const_iterator find(const char* name) const { return const_iterator(FindText(name), this); }
    size_type count(const key_type& name) const { return FindNode(name) != nullptr ? 1 : 0; }
    ///@}

    /// Grows for one more entry, then adds `entry` unless an equal name is
    /// there: the iterator of the entry with that name, and whether it is new.
    /// The range form inserts each entry in turn.
    ///@{
    std::pair<iterator, bool> insert(const value_type& entry) { return Emplace(entry.first, entry); }
    std::pair<iterator, bool> insert(value_type&& entry) { return Emplace(entry.first, std::move(entry)); }
    template <class InputIterator>
    void insert(InputIterator first, InputIterator last)
    {
        for (; first != last; ++first) {
            insert(*first);
        }
    }
    ///@}

    /// Adds `name` with a value made from `args` unless an equal name is
    /// there, growing first as insert does; nothing is made for a name that
    /// is there.
    template <class... Args>
    std::pair<iterator, bool> try_emplace(const key_type& name, Args&&... args)
    {
        return Emplace(name, std::piecewise_construct, std::forward_as_tuple(name),
                       std::forward_as_tuple(std::forward<Args>(args)...));
    }

    /// The value of `name`, added default-made if missing; grows first, also
    /// when the name is there.
    mapped_type& operator[](const key_type& name) { return try_emplace(name).first->second; }

    /// Removes the entry with `name` (1, or 0 if there is none), the entry at
    /// an iterator, or a range; other entries keep their places.
    ///@{
    size_type erase(const key_type& name) { return EraseNode(FindNode(name)); }
    size_type erase(const char* name) { return EraseNode(FindText(name)); }
    void erase(iterator position) { EraseNode(position.m_node); }
    void erase(const_iterator position) { EraseNode(position.m_node); }
    void erase(iterator first, iterator last)
    {
        while (first != last) {
            erase(first++);
        }
    }
    ///@}

    /// Removes every entry; the bucket count stays.
    void clear()
    {
        Release(true);
        m_size = 0;
        m_ambiguous = false;
    }

    /// Grows as an insertion into a table of `hint` - 1 entries would.
    void resize(size_type hint)
    {
        if (hint > m_bucketCount) {
            Rehash(NextBucketCount(hint));
        }
    }

    /// Exchanges the entries, bucket counts and indexes of two tables.
    void swap(NameTable& other) noexcept
    {
        std::swap(m_buckets, other.m_buckets);
        std::swap(m_bucketCount, other.m_bucketCount);
        std::swap(m_slots, other.m_slots);
        std::swap(m_tags, other.m_tags);
        std::swap(m_slotMask, other.m_slotMask);
        std::swap(m_size, other.m_size);
        std::swap(m_ambiguous, other.m_ambiguous);
        std::swap(m_free, other.m_free);
        std::swap(m_blocks, other.m_blocks);
        std::swap(m_unused, other.m_unused);
        std::swap(m_unusedEnd, other.m_unusedEnd);
        Node* recent = m_recent.load(std::memory_order_relaxed);
        m_recent.store(other.m_recent.load(std::memory_order_relaxed), std::memory_order_relaxed);
        other.m_recent.store(recent, std::memory_order_relaxed);
    }

    /// The entry with the name `text` of `length` bytes whose FoldedNameHash
    /// is `fold`, or end(): the lookup without a key for the library's own
    /// passes. The entry found is remembered for FindRecent.
    ///@{
    iterator FindEntry(const char* text, size_type length, unsigned int fold)
    {
        return iterator(Remember(FindNode(text, length, fold)), this);
    }
    const_iterator FindEntry(const char* text, size_type length, unsigned int fold) const
    {
        return const_iterator(Remember(FindNode(text, length, fold)), this);
    }
    ///@}

    /// As FindEntry, for a caller that asks for one name many times in a
    /// row: the entry found last is compared first, and the name's hash is
    /// not computed for it. `fold()` gives FoldedNameHash of the name.
    ///@{
    template <class Fold>
    iterator FindRecent(const char* text, size_type length, Fold fold)
    {
        return iterator(FindRecentNode(text, length, fold), this);
    }
    template <class Fold>
    const_iterator FindRecent(const char* text, size_type length, Fold fold) const
    {
        return const_iterator(FindRecentNode(text, length, fold), this);
    }
    ///@}

private:
    struct Node {
        template <class... Args>
        Node(unsigned int bucketHash_, unsigned int foldHash_, Args&&... args)
            : bucketHash(bucketHash_), foldHash(foldHash_), value(std::forward<Args>(args)...)
        {
        }
        Node* next = nullptr;
        // The pointer that points at this node: its bucket or the node before.
        Node** link = nullptr;
        unsigned int bucketHash;
        unsigned int foldHash;
        value_type value;
    };

    // Nodes come from blocks that the table owns, so that a table of many
    // small entries costs a few allocations and frees them at once.
    struct Block {
        Block* next;
    };
    static constexpr size_type kNodeOffset = (sizeof(Block) + alignof(Node) - 1) / alignof(Node) * alignof(Node);
    static constexpr size_type kSmallestBlock = 16;
    static constexpr size_type kLargestBlock = 1024;

    // An erased node's storage, waiting for reuse.
    struct FreeSlot {
        FreeSlot* next;
    };

    void* AllocateNode(size_type expected)
    {
        if (m_free != nullptr) {
            FreeSlot* slot = m_free;
            m_free = slot->next;
            return slot;
        }
        if (m_unused == m_unusedEnd) {
            // A table that grows one entry at a time gets blocks of half its
            // size, which wastes at most a third; a copy gets one block.
            size_type nodes = expected == m_size + 1 ? expected / 2 : expected;
            if (nodes < kSmallestBlock) {
                nodes = kSmallestBlock;
            } else if (nodes > kLargestBlock && expected == m_size + 1) {
                nodes = kLargestBlock;
            }
            char* raw = static_cast<char*>(::operator new(kNodeOffset + nodes * sizeof(Node)));
            Block* block = reinterpret_cast<Block*>(raw);
            block->next = m_blocks;
            m_blocks = block;
            m_unused = raw + kNodeOffset;
            m_unusedEnd = m_unused + nodes * sizeof(Node);
        }
        void* node = m_unused;
        m_unused += sizeof(Node);
        return node;
    }

    void FreeStorage(void* storage) { m_free = ::new (storage) FreeSlot{m_free}; }

    void FreeNode(Node* node)
    {
        node->~Node();
        FreeStorage(node);
    }

    // Frees every node and block, and the buckets and index unless the
    // table is to be used again.
    void Release(bool keepArrays = false) noexcept
    {
        if (m_buckets != nullptr) {
            size_type left = m_size;
            for (size_type b = 0; left != 0 && b < m_bucketCount; ++b) {
                for (Node* node = m_buckets[b]; node != nullptr; --left) {
                    Node* next = node->next;
                    node->~Node();
                    node = next;
                }
            }
            if (keepArrays) {
                std::fill(m_buckets, m_buckets + m_bucketCount, nullptr);
            } else {
                delete[] m_buckets;
                m_buckets = nullptr;
            }
        }
        if (keepArrays && m_slots != nullptr) {
            std::fill(m_slots, m_slots + m_slotMask + 1, nullptr);
        } else {
            ::operator delete(static_cast<void*>(m_slots));
            m_slots = nullptr;
            m_tags = nullptr;
            m_slotMask = 0;
        }
        while (m_blocks != nullptr) {
            Block* next = m_blocks->next;
            ::operator delete(static_cast<void*>(m_blocks));
            m_blocks = next;
        }
        m_free = nullptr;
        m_unused = m_unusedEnd = nullptr;
        m_recent.store(nullptr, std::memory_order_relaxed);
    }

    size_type BucketOf(unsigned int bucketHash) const { return bucketHash % m_bucketCount; }

    void LinkAtHead(Node* node)
    {
        Node** head = &m_buckets[BucketOf(node->bucketHash)];
        node->next = *head;
        node->link = head;
        if (*head != nullptr) {
            (*head)->link = &node->next;
        }
        *head = node;
    }

    void Unlink(Node* node)
    {
        *node->link = node->next;
        if (node->next != nullptr) {
            node->next->link = node->link;
        }
    }

    Node* FirstNode() const
    {
        if (m_size == 0) {
            return nullptr;
        }
        for (size_type b = 0; b < m_bucketCount; ++b) {
            if (m_buckets[b] != nullptr) {
                return m_buckets[b];
            }
        }
        return nullptr;
    }

    Node* NextNode(const Node* node) const
    {
        if (node->next != nullptr) {
            return node->next;
        }
        for (size_type b = BucketOf(node->bucketHash) + 1; b < m_bucketCount; ++b) {
            if (m_buckets[b] != nullptr) {
                return m_buckets[b];
            }
        }
        return nullptr;
    }

    // Chains in the classic growth order: buckets upward, head to tail, each
    // node to the head of its new chain.
    void Rehash(size_type count)
    {
        Node** buckets = new Node*[count]();
        Node** old = m_buckets;
        const size_type oldCount = m_bucketCount;
        m_buckets = buckets;
        m_bucketCount = count;
        if (old == nullptr) {
            return;
        }
        for (size_type b = 0; b < oldCount; ++b) {
            for (Node* node = old[b]; node != nullptr;) {
                Node* next = node->next;
                LinkAtHead(node);
                node = next;
            }
        }
        delete[] old;
    }

    // The index: linear probing on the folded hash over a power of two of
    // slots, at most four fifths full. Beside each slot its hash's top half,
    // so that a probe reads a node only when that matches.
    static unsigned short TagOf(unsigned int fold) { return static_cast<unsigned short>(fold >> 16); }

    void IndexAdd(Node* node)
    {
        size_type i = node->foldHash & m_slotMask;
        while (m_slots[i] != nullptr) {
            i = (i + 1) & m_slotMask;
        }
        m_slots[i] = node;
        m_tags[i] = TagOf(node->foldHash);
    }

    void GrowIndex(size_type entries)
    {
        size_type capacity = 16;
        while (capacity < entries + entries / 4) {
            capacity *= 2;
        }
        if (capacity <= m_slotMask + 1 && m_slots != nullptr) {
            return;
        }
        // One block: the slots, then their tags.
        // NOLINTNEXTLINE(bugprone-sizeof-expression): an array of pointers.
        void* block = ::operator new(capacity*(sizeof(Node*) + sizeof(unsigned short)));
        Node** slots = static_cast<Node**>(block);
        std::fill(slots, slots + capacity, nullptr);
        Node** old = m_slots;
        const size_type oldCapacity = m_slotMask + 1;
        m_slots = slots;
        m_tags = reinterpret_cast<unsigned short*>(slots + capacity);
        m_slotMask = capacity - 1;
        if (old != nullptr) {
            for (size_type i = 0; i < oldCapacity; ++i) {
                if (old[i] != nullptr) {
                    IndexAdd(old[i]);
                }
            }
            ::operator delete(static_cast<void*>(old));
        }
    }

    // Backward-shift deletion keeps every probe run unbroken.
    void IndexRemove(const Node* node)
    {
        size_type i = node->foldHash & m_slotMask;
        while (m_slots[i] != node) {
            i = (i + 1) & m_slotMask;
        }
        for (size_type j = (i + 1) & m_slotMask; m_slots[j] != nullptr; j = (j + 1) & m_slotMask) {
            const size_type home = m_slots[j]->foldHash & m_slotMask;
            // Move slot j back to the hole unless its home lies after the
            // hole (cyclically) up to j.
            if (((j - home) & m_slotMask) >= ((j - i) & m_slotMask)) {
                m_slots[i] = m_slots[j];
                m_tags[i] = m_tags[j];
                i = j;
            }
        }
        m_slots[i] = nullptr;
    }

    Node* Remember(Node* node) const
    {
        m_recent.store(node, std::memory_order_relaxed);
        return node;
    }

    template <class Fold>
    Node* FindRecentNode(const char* text, size_type length, Fold fold) const
    {
        Node* recent = m_recent.load(std::memory_order_relaxed);
        if (recent != nullptr && !m_ambiguous && AsciiCaseFolding() && NameIs(recent, text, length)) {
            return recent;
        }
        return Remember(FindNode(text, length, fold()));
    }

    // Only where the locale folds A-Z alone, as strcasecmp would then.
    static bool NameIs(const Node* node, const char* text, size_type length)
    {
        const key_type& name = node->value.first;
        return name.size() == length && AsciiFoldedEqual(name.c_str(), text, length);
    }

    Node* FindText(const char* text) const
    {
        if (text == nullptr) {
            text = "";
        }
        const size_type length = std::strlen(text);
        return FindNode(text, length, FoldedNameHash(text, length));
    }

    Node* FindNode(const key_type& name) const { return FindNode(name.c_str(), name.size(), name.FoldHash()); }

    Node* FindNode(const char* text, size_type length, unsigned int fold) const
    {
        if (m_size == 0) {
            return nullptr;
        }
        if (!m_ambiguous && AsciiCaseFolding()) {
            const unsigned short tag = TagOf(fold);
            for (size_type i = fold & m_slotMask;; i = (i + 1) & m_slotMask) {
                Node* node = m_slots[i];
                if (node == nullptr) {
                    return nullptr;
                }
                if (m_tags[i] == tag && node->foldHash == fold && NameIs(node, text, length)) {
                    return node;
                }
            }
        }
        return FindInChain(text, BucketOf(BucketHash()(text, length)));
    }

    Node* FindInChain(const char* text, size_type bucket) const
    {
        for (Node* node = m_buckets[bucket]; node != nullptr; node = node->next) {
            if (strcasecmp(node->value.first.c_str(), text) == 0) {
                return node;
            }
        }
        return nullptr;
    }

    template <class... Args>
    std::pair<iterator, bool> Emplace(const key_type& name, Args&&... args)
    {
        const char* text = name.c_str();
        const size_type length = name.size();
        const unsigned int fold = name.FoldHash();
        const unsigned int bucketHash = BucketHash()(text, length);
        resize(m_size + 1);
        if (m_buckets == nullptr) {
            m_buckets = new Node*[m_bucketCount]();
        }
        GrowIndex(m_size + 1);
        const bool asciiFolding = AsciiCaseFolding();
        Node* found =
            !m_ambiguous && asciiFolding ? FindNode(text, length, fold) : FindInChain(text, BucketOf(bucketHash));
        if (found != nullptr) {
            return {iterator(found, this), false};
        }
        if (!asciiFolding && !m_ambiguous) {
            // Equal names of another locale must not hide one another in the
            // index.
            for (size_type i = fold & m_slotMask; m_slots[i] != nullptr; i = (i + 1) & m_slotMask) {
                if (m_slots[i]->foldHash == fold && AsciiFoldedEqual(m_slots[i]->value.first.c_str(), text)) {
                    m_ambiguous = true;
                    break;
                }
            }
        }
        void* storage = AllocateNode(m_size + 1);
        Node* node;
        try {
            node = ::new (storage) Node(bucketHash, fold, std::forward<Args>(args)...);
        } catch (...) {
            FreeStorage(storage);
            throw;
        }
        LinkAtHead(node);
        IndexAdd(node);
        ++m_size;
        return {iterator(node, this), true};
    }

    size_type EraseNode(Node* node)
    {
        if (node == nullptr) {
            return 0;
        }
        if (node == m_recent.load(std::memory_order_relaxed)) {
            m_recent.store(nullptr, std::memory_order_relaxed);
        }
        Unlink(node);
        IndexRemove(node);
        FreeNode(node);
        if (--m_size == 0) {
            m_ambiguous = false;
        }
        return 1;
    }

    // How CopyFrom makes each entry: a plain copy, or a borrowing one.
    struct Counted {};
    static Node* MakeNode(void* storage, const Node& from, Counted)
    {
        return ::new (storage) Node(from.bucketHash, from.foldHash, from.value);
    }
    static Node* MakeNode(void* storage, const Node& from, BorrowingCopy borrowing)
    {
        return ::new (storage) Node(from.bucketHash, from.foldHash, std::piecewise_construct,
                                    std::forward_as_tuple(from.value.first, borrowing),
                                    std::forward_as_tuple(from.value.second, borrowing));
    }

    // Same bucket count, every chain in its order.
    template <class How>
    void CopyFrom(const NameTable& other, How how)
    {
        if (other.m_size == 0) {
            return;
        }
        try {
            m_buckets = new Node*[m_bucketCount]();
            GrowIndex(other.m_size);
            for (size_type b = 0; b < m_bucketCount; ++b) {
                Node** tail = &m_buckets[b];
                for (const Node* from = other.m_buckets[b]; from != nullptr; from = from->next) {
                    Node* node = MakeNode(AllocateNode(other.m_size), *from, how);
                    node->link = tail;
                    *tail = node;
                    tail = &node->next;
                    IndexAdd(node);
                    ++m_size;
                }
            }
            m_ambiguous = other.m_ambiguous;
        } catch (...) {
            Release();
            m_size = 0;
            throw;
        }
    }

    Node** m_buckets = nullptr;
    size_type m_bucketCount = 0;
    Node** m_slots = nullptr;
    unsigned short* m_tags = nullptr;
    size_type m_slotMask = 0;
    size_type m_size = 0;
    // Set when two entries with A-Z-equal names were stored under a locale
    // that told them apart: the index can no longer pick between them.
    bool m_ambiguous = false;
    // The entry FindEntry or FindRecent found last. Atomic only so that finds, which
    // callers may run side by side on one table, never race on it.
    mutable std::atomic<Node*> m_recent{nullptr};
    FreeSlot* m_free = nullptr;
    Block* m_blocks = nullptr;
    char* m_unused = nullptr;
    char* m_unusedEnd = nullptr;
};

/// Exchanges two tables, as a.swap(b).
template <class Key, class Mapped, class BucketHash, class Equal>
void swap(NameTable<Key, Mapped, BucketHash, Equal>& a, NameTable<Key, Mapped, BucketHash, Equal>& b) noexcept
{
    a.swap(b);
}

}  // namespace tessaline::config

#endif
