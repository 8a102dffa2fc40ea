#include "wholebonds.h"

#include "atomicfile.h"
#include "filestates.h"
#include "interfacefile.h"
#include "interfacename.h"
#include "remembered.h"
#include "settings.h"

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <set>
#include <string>
#include <unistd.h>

namespace vornhost {
namespace {

constexpr char kFilePrefix[] = "ifcfg-";
constexpr char kOptionsKey[] = "BONDING_OPTS";

std::string MemoryFolder()
{
    return std::string(kRememberedFolder) + "/whole";
}

std::string MemoryPath(const std::string& bond)
{
    return MemoryFolder() + '/' + kFilePrefix + bond;
}

std::set<std::string> InterfacesWithFilesIn(const std::string& folder)
{
    std::set<std::string> names;
    std::error_code error; // no folder holds no files
    std::filesystem::directory_iterator entries(folder, error);
    for (; !error && entries != std::filesystem::directory_iterator(); entries.increment(error)) {
        const std::string name = InterfaceOfFileName(entries->path().filename());
        if (!name.empty()) {
            names.insert(name);
        }
    }
    return names;
}

bool IsWholeOnSwitch(const std::string& bond, const KeyValueFile& file)
{
    const std::string bridge = kBridgePrefix + bond;
    if (file.Get("DEVICE") != bond || !file.Get(kOptionsKey) || file.Get("BRIDGE") != bridge) {
        return false;
    }
    const auto state = ReadFileState(bridge);
    const auto bridgeFile = KeyValueFile::Parse(state && state->text ? *state->text : "");
    return bridgeFile.Get("TYPE") == "OVS" && bridgeFile.Get("PRIMARY") == bond &&
           !bridgeFile.Get("SLAVE_LIST");
}

bool Remember(const std::string& bond, const KeyValueFile& file)
{
    const auto known = KeyValueFile::Load(MemoryPath(bond));
    if (known && known->Text() == file.Text()) {
        return true;
    }
    std::error_code ignored; // the write says what is wrong with the folder
    std::filesystem::create_directories(MemoryFolder(), ignored);
    return ReplaceFile(MemoryPath(bond), file.Text(), kPrivateFile);
}

/** Whether the files say that the way back is over; half of it leaves the bridge's file or name. */
bool IsBack(const std::string& bond, const FileState& file, const FileState& bridge)
{
    return !bridge.text && (!file.text || KeyValueFile::Parse(*file.text).Get("DEVICE") == bond);
}

bool GiveBack(const std::string& bond)
{
    const auto known = KeyValueFile::Load(MemoryPath(bond));
    auto file = ReadFileState(bond);
    const auto bridge = ReadFileState(kBridgePrefix + bond);
    if (!known || !file || !bridge) {
        return false;
    }
    if (!IsBack(bond, *file, *bridge)) {
        return true;
    }
    const auto now = KeyValueFile::Parse(file->text.value_or(""));
    // Who has deleted the file or written options meanwhile wants it so.
    if (file->text && !now.Get(kOptionsKey)) {
        KeyValueFile whole = *known;
        (void)whole.Remove("BRIDGE");
        (void)CarryChanges(
            *known, now, [](const std::string&) { return true; }, whole);
        file->text = whole.Text();
        if (!WriteFileState(bond, *file)) {
            return false;
        }
    }
    return ::unlink(MemoryPath(bond).c_str()) == 0;
}

void Complain(const std::string& bond, const char* what, std::vector<Remark>& remarks)
{
    remarks.push_back({Severity::kWarning, std::string("the options of ") + bond + ' ' + what +
                                               ": " + std::strerror(errno)});
}

} // namespace

void MindWholeBonds(std::vector<Remark>& remarks)
{
    for (const std::string& name : InterfacesWithFilesIn(kConfigurationFolder)) {
        const auto state = ReadFileState(name);
        const auto file = KeyValueFile::Parse(state && state->text ? *state->text : "");
        if (IsWholeOnSwitch(name, file) && !Remember(name, file)) {
            Complain(name, "cannot be remembered", remarks);
        }
    }
    for (const std::string& name : InterfacesWithFilesIn(MemoryFolder())) {
        if (!GiveBack(name)) {
            Complain(name, "cannot be given back", remarks);
        }
    }
}

} // namespace vornhost
