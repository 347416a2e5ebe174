// Following a chain of symbolic links to the file at its end.
#include "config/final_target.h"

#include <cerrno>
#include <climits>

#include "config/sys.h"

namespace tessaline::config {

namespace {

// The kernel's own limit on the links of one lookup.
constexpr int kMaxLinks = 40;

}  // namespace

bool FinalTarget(const char* name, std::string& target)
{
    target.assign(name);
    char link[PATH_MAX];
    for (int followed = 0;; ++followed) {
        const ssize_t length = Sys().readlink(target.c_str(), link, sizeof link);
        if (length < 0) {
            // Not a link, or nothing there yet: this is the file itself.
            return errno == EINVAL || errno == ENOENT;
        }
        if (followed == kMaxLinks) {
            errno = ELOOP;
            return false;
        }
        if (length > 0 && link[0] == '/') {
            target.clear();
        } else {
            const std::string::size_type slash = target.rfind('/');
            target.erase(slash == std::string::npos ? 0 : slash + 1);
        }
        target.append(link, static_cast<std::size_t>(length));
        if (target.size() >= PATH_MAX) {
            errno = ENAMETOOLONG;
            return false;
        }
    }
}

}  // namespace tessaline::config
