#include "core/containers.h"
#include "core/guard.h"
#include "support/runlock.h"

#include "support/atomicfile.h"
#include "support/keyvaluefile.h"

#include <cerrno>
#include <cstring>
#include <optional>
#include <string>

#include <sys/stat.h>
#include <vornplatform/core.h>

namespace {

using vornhost::Descriptor;
using vornhost::Guarded;
using vornhost::KeyValueFile;

constexpr mode_t kModeOfNewFile = 0644;
constexpr char kLineFormat[] = "%s=%s\n";
/** An edit takes milliseconds; whoever waits longer for another's is better told so. */
constexpr int kEditSeconds = 5;

enum class WhenMissing { kFail, kMake };

/**
 * Changes a file in one step. Edits of all processes come one after the other, so that none is
 * lost between another's reading and writing.
 * @param change  edits the file; answers whether it could.
 * @return 0, or -1 and the file is as it was.
 */
template <typename Change>
int Edit(const char* path, WhenMissing whenMissing, const Change& change)
{
    const Descriptor lock =
        vornhost::TakeRunLock("keyvalue", vornhost::LockDeadlineIn(kEditSeconds));
    if (!lock) {
        return -1;
    }
    std::optional<KeyValueFile> file = KeyValueFile::Load(path);
    const bool isMissing = !file && errno == ENOENT;
    if (isMissing && whenMissing == WhenMissing::kMake) {
        file = KeyValueFile::Parse("");
    }
    if (!file) {
        return -1;
    }

    const std::string before = file->Text();
    if (!change(*file)) {
        return -1;
    }
    if (!isMissing && file->Text() == before) {
        return 0;
    }
    return vornhost::ReplaceFile(path, file->Text(), kModeOfNewFile) ? 0 : -1;
}

std::optional<std::string> ReadValue(const char* path, const char* key)
{
    const std::optional<KeyValueFile> file = KeyValueFile::Load(path);
    return file ? file->Get(key) : std::nullopt;
}

} // namespace

int VLIBCFileGetKeyValue(const char* path, const char* key, char* value, int size, int)
{
    if (path == nullptr || key == nullptr || value == nullptr) {
        return -1;
    }
    return Guarded(-1, [&] {
        const std::optional<std::string> found = ReadValue(path, key);
        // A value that does not fit is refused: its beginning is another value.
        if (!found || size < 0 || found->size() >= static_cast<size_t>(size)) {
            return -1;
        }
        std::memcpy(value, found->c_str(), found->size() + 1);
        return 0;
    });
}

int VLIBCFileSetKeyValue(const char* path, const char* key, const char* value, int)
{
    if (path == nullptr || key == nullptr || value == nullptr) {
        return -1;
    }
    return Guarded(-1, [&] {
        return Edit(path, WhenMissing::kMake,
                    [&](KeyValueFile& file) { return file.Set(key, value); });
    });
}

int VLIBCFileSetKeys(const char* path, VLIBCSzHash* set, VLIBCSzHash* remove, const char* format)
{
    // The one format there is; another would write lines that nobody finds again.
    if (path == nullptr || set == nullptr || format == nullptr ||
        std::strcmp(format, kLineFormat) != 0) {
        return -1;
    }
    if (set->incomplete || (remove != nullptr && remove->incomplete)) {
        return -1;
    }
    return Guarded(-1, [&] {
        const auto whenMissing = set->entries.empty() ? WhenMissing::kFail : WhenMissing::kMake;
        return Edit(path, whenMissing, [&](KeyValueFile& file) {
            for (const auto& [key, value] : set->entries) {
                if (!file.Set(key, value)) {
                    return false;
                }
            }
            if (remove == nullptr) {
                return true;
            }
            for (const auto& [key, value] : remove->entries) {
                if (!KeyValueFile::IsKey(key)) {
                    return false;
                }
                (void)file.Remove(key); // one that is not there is as good as removed
            }
            return true;
        });
    });
}

int VLIBCFileRemoveKey(const char* path, const char* key)
{
    if (path == nullptr || key == nullptr) {
        return -1;
    }
    return Guarded(-1, [&] {
        return Edit(path, WhenMissing::kFail, [&](KeyValueFile& file) {
            (void)file.Remove(key); // one that is not there is as good as removed
            return KeyValueFile::IsKey(key);
        });
    });
}

int VLIBCFileCheckKeyValue(const char* path, const char* key, const char* value, int)
{
    if (path == nullptr || key == nullptr || value == nullptr) {
        return 0;
    }
    return Guarded(0, [&] { return ReadValue(path, key) == std::string(value) ? 1 : 0; });
}

int VLIBCFileExist(const char* path)
{
    struct stat status {};
    return path != nullptr && ::stat(path, &status) == 0 ? 1 : 0;
}

int VLIBCFileCheckDir(const char* path)
{
    struct stat status {};
    return path != nullptr && ::stat(path, &status) == 0 && S_ISDIR(status.st_mode) ? 1 : 0;
}
