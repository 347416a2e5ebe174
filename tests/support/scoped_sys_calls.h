// The test switch of the platform seams: each subsystem routes the calls
// that tests fault or skip through a table (files::Sys(), config::Sys(),
// thread::Sys(), util::Sys()). A test changes entries of the live table
// inside the scope of one of these; the whole table comes back at its end.
//
//   testing::ScopedSysCalls calls(files::Sys());
//   files::Sys().write = [](int, const void*, size_t) -> ssize_t { return Fail(ENOSPC); };
#ifndef TESSALINE_TESTS_SUPPORT_SCOPED_SYS_CALLS_H
#define TESSALINE_TESTS_SUPPORT_SCOPED_SYS_CALLS_H

namespace tessaline::testing {

template <typename Table>
class ScopedSysCalls {
public:
    explicit ScopedSysCalls(Table& live) : m_live(live), m_saved(live) {}
    ~ScopedSysCalls() { m_live = m_saved; }
    ScopedSysCalls(const ScopedSysCalls&) = delete;
    ScopedSysCalls& operator=(const ScopedSysCalls&) = delete;

private:
    Table& m_live;
    Table m_saved;
};

}  // namespace tessaline::testing

#endif
