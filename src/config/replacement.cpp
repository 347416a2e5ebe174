// Writing a temporary file beside the configuration file and renaming it
// into place, with every step checked and synced.
#include "config/replacement.h"

#include <cerrno>
#include <climits>
#include <cstdio>
#include <string>

#include <unistd.h>

#include "config/final_target.h"
#include "config/side_name.h"
#include "config/sys.h"
#include "tessaline/config/rvConfig.h"
#include "util/error_text.h"
#include "util/sys.h"

namespace tessaline::config {

namespace {

constexpr int kCreateAttempts = 3;
constexpr mode_t kFreshFileMode = 0666;
constexpr mode_t kOwnerOnly = 0600;

void ReportUnlinkFailure(const char* name)
{
    const int error = errno;
    std::fprintf(stderr, "rvConfig: unlink(%s) failed: %s (%d).", name, util::ErrorText(error), error);
}

// Replaces an existing file so that its name never stands empty: the old
// file gets its backup name as a second link, and the temporary file is
// renamed over it. False, with nothing changed but an earlier backup gone,
// where a step is refused (a file system without hard links, say).
bool ReplaceInOneStep(const char* configName, const char* tempName, const std::string& backupName)
{
    if (rvConfig::m_bBackups == 0) {
        return Sys().rename(tempName, configName) == 0;
    }
    Sys().unlink(backupName.c_str());
    if (Sys().link(configName, backupName.c_str()) != 0) {
        return false;
    }
    if (Sys().rename(tempName, configName) != 0) {
        Sys().unlink(backupName.c_str());
        return false;
    }
    return true;
}

// Moves the old file aside (or removes it) and renames the temporary file
// into its place, step by step, with a message for each failure. 1 when
// the file was replaced as asked.
unsigned int ReplaceInSteps(const char* configName, const char* tempName, const std::string& backupName,
                            bool oldFileExists)
{
    unsigned int result = 1;
    if (oldFileExists) {
        if (rvConfig::m_bBackups != 0) {
            Sys().unlink(backupName.c_str());
            if (Sys().rename(configName, backupName.c_str()) != 0) {
                std::fprintf(stderr, "Error creating backup config file %s: %s\n", configName, util::ErrorText(errno));
                result = 0;
            }
        } else if (Sys().unlink(configName) != 0) {
            ReportUnlinkFailure(configName);
        }
    }
    if (Sys().rename(tempName, configName) != 0) {
        const int error = errno;
        std::fprintf(stderr, "rvConfig: rename(%s, %s) failed: %s (%d).", tempName, configName, util::ErrorText(error),
                     error);
        // Without backups the old file is gone and the temporary file holds
        // the only copy on disk: it stays.
        if (rvConfig::m_bBackups != 0 && Sys().unlink(tempName) != 0) {
            ReportUnlinkFailure(tempName);
        }
        return 0;
    }
    return result;
}

}  // namespace

// A name whose side files would pass the path limit is refused rather than
// cut: a cut name is another file.
Replacement::Replacement(const char* configName)
    : m_named(FinalTarget(configName, m_configName)), m_file(nullptr), m_good(true)
{
    if (m_named) {
        m_tempName = SideFileName(m_configName, "new");
        m_backupName = SideFileName(m_configName, "bak");
        m_named = m_tempName.size() < PATH_MAX && m_backupName.size() < PATH_MAX;
    }
}

Replacement::~Replacement()
{
    if (m_file != nullptr) {
        Sys().fclose(m_file);
        Sys().unlink(m_tempName.c_str());
    }
}

// The temporary file takes the permission bits, owner and group of the file
// it will replace, so that a file kept from other users stays so and a
// service's file stays the service's after root rewrote it; it is created
// owner-only until they are set. Where the process may not give the owner
// and group away (it is not privileged, and the group is not its own), the
// file stays the writer's, as any new file would be. Without a file to
// replace it gets the mode of a new fopen.
bool Replacement::Create()
{
    if (!m_named) {
        return false;
    }
    struct stat old;
    const bool replacing = Sys().stat(m_configName.c_str(), &old) == 0;
    for (int attempt = 1; attempt <= kCreateAttempts; ++attempt) {
        m_file = sys::CreateStream(m_tempName.c_str(), replacing ? kOwnerOnly : kFreshFileMode);
        if (m_file != nullptr) {
            if (replacing) {
                // Owner first: a change of owner clears set-id bits.
                Sys().fchown(fileno(m_file), old.st_uid, old.st_gid);
                Sys().fchmod(fileno(m_file), old.st_mode & 07777);
            }
            return true;
        }
        util::PauseOneSecond();
    }
    return false;
}

void Replacement::Write(const char* text, std::size_t length)
{
    m_good = m_good && sys::Write(m_file, text, length);
}

// The one-step replacement where the file system allows it; else the
// steps, which then give every message and result as if they had been the
// only way.
unsigned int Replacement::Commit()
{
    FILE* file = m_file;
    m_file = nullptr;
    m_good = sys::CloseSynced(file) && m_good;
    if (!m_good) {
        Sys().unlink(m_tempName.c_str());
        return 0;
    }
    const char* configName = m_configName.c_str();
    const char* tempName = m_tempName.c_str();
    const std::string& backupName = m_backupName;
    // The side files share the file's directory, so one sync after the
    // renames makes the new name and the backup durable together.
    const bool oldFileExists = Sys().access(configName, F_OK) == 0;
    const unsigned int result = oldFileExists && ReplaceInOneStep(configName, tempName, backupName)
                                    ? 1
                                    : ReplaceInSteps(configName, tempName, backupName, oldFileExists);
    sys::SyncDirectory(configName);
    return result;
}

}  // namespace tessaline::config
