// Freeing a whole configuration's tables.
//
// A table of 100,000 keys is some 100,000 small blocks, one per value. glibc's malloc keeps
// freed small blocks on fast lists and merges them only at the next large
// request, which the next load makes at once (every key table starts with
// 193 buckets). That merge then walks all of the blocks after they have left
// the cache and costs more than the rest of a reload. Asking for one large
// block after each section lets the merge run over the blocks just freed,
// while they are still in cache, here after every thousand or so entries.
// Other allocators see a harmless request.
#include "config/release.h"

#include <cstdlib>

namespace tessaline::config {

namespace {

// Above the largest request glibc serves from its per-thread cache (1,032
// bytes), which would answer it without looking at the fast lists.
constexpr std::size_t kLargeRequest = 2048;

// Small tables leave the merge to the next large request: one merge of a
// few blocks costs less than many.
constexpr std::size_t kEntriesPerSettle = 1024;

void SettleFreedBlocks()
{
    // Volatile, so that the compiler keeps the pair it could otherwise drop.
    void* volatile block = std::malloc(kLargeRequest);
    std::free(block);
}

}  // namespace

void ReleaseKeys(rvConfig::SectionTable& sections)
{
    std::size_t freed = 0;
    for (rvConfig::SectionTable::iterator it = sections.begin(); it != sections.end(); ++it) {
        freed += it->second.size();
        it->second.clear();
        if (freed >= kEntriesPerSettle) {
            SettleFreedBlocks();
            freed = 0;
        }
    }
}

}  // namespace tessaline::config
