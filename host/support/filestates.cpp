#include "filestates.h"

#include "atomicfile.h"
#include "interfacefile.h"

#include <cerrno>
#include <cstring>
#include <sys/stat.h>
#include <syslog.h>
#include <unistd.h>

namespace vornhost {
namespace {

constexpr unsigned kPermissions = 07777;

std::string PathOf(const std::string& interface)
{
    return std::string(kConfigurationFolder) + "/ifcfg-" + interface;
}

} // namespace

std::optional<FileState> ReadFileState(const std::string& interface)
{
    const auto file = KeyValueFile::Load(PathOf(interface));
    if (!file) {
        return errno == ENOENT ? std::optional<FileState>(FileState{}) : std::nullopt;
    }
    FileState state;
    state.text = file->Text();
    struct stat status {};
    if (::stat(PathOf(interface).c_str(), &status) == 0) {
        state.mode = status.st_mode & kPermissions;
    }
    return state;
}

std::optional<FileStates> ReadFileStates(const std::vector<std::string>& interfaces)
{
    FileStates states;
    for (const std::string& interface : interfaces) {
        const auto state = ReadFileState(interface);
        if (!state) {
            ::syslog(LOG_ERR, "vornovs: cannot read %s: %s", PathOf(interface).c_str(),
                     std::strerror(errno));
            return std::nullopt;
        }
        states[interface] = *state;
    }
    return states;
}

bool WriteFileState(const std::string& interface, const FileState& state)
{
    const std::string path = PathOf(interface);
    if (!state.text) {
        return ::unlink(path.c_str()) == 0 || errno == ENOENT;
    }
    const auto file = KeyValueFile::Load(path);
    return (file && file->Text() == *state.text) || ReplaceFile(path, *state.text, state.mode);
}

bool WriteFileStates(const std::vector<std::string>& order, const FileStates& states)
{
    for (const std::string& interface : order) {
        const auto state = states.find(interface);
        if (state != states.end() && !WriteFileState(interface, state->second)) {
            ::syslog(LOG_ERR, "vornovs: cannot write %s: %s", PathOf(interface).c_str(),
                     std::strerror(errno));
            return false;
        }
    }
    return true;
}

KeyValueFile FileOf(const FileStates& states, const std::string& interface)
{
    const auto state = states.find(interface);
    const bool exists = state != states.end() && state->second.text;
    return KeyValueFile::Parse(exists ? *state->second.text : "");
}

std::optional<std::vector<GatewayState>>
ReadGatewayStates(const std::vector<std::string>& interfaces)
{
    const auto store = GatewayStore::Load();
    if (!store) {
        return std::nullopt;
    }
    std::vector<GatewayState> states;
    for (const std::string& interface : interfaces) {
        for (const AddressFamily family : {AddressFamily::kIPv4, AddressFamily::kIPv6}) {
            states.push_back({interface, family, store->Find(interface, family)});
        }
    }
    return states;
}

bool WriteGatewayStates(const std::vector<GatewayState>& states)
{
    const GatewayStoreLock lock;
    auto store = lock.Held() ? GatewayStore::Load() : std::nullopt;
    if (!store) {
        return false;
    }
    for (const auto& [interface, family, gateway] : states) {
        if (gateway) {
            (void)store->Set(interface, family, *gateway);
        } else {
            (void)store->Remove(interface, family);
        }
    }
    return store->Save();
}

} // namespace vornhost
