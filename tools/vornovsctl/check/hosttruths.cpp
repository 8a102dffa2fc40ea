#include "hosttruths.h"

#include "show/readhost.h"

#include <algorithm>
#include <filesystem>
#include <string_view>
#include <support/remembered.h>
#include <system_error>
#include <utility>

namespace vornovsctl {

namespace {

namespace fs = std::filesystem;

constexpr char kListFolder[] = "/usr/vorn/etc/vornovs";
constexpr std::string_view kReplacement = ".vornovs-"; // what a file is written as at first
constexpr std::string_view kListReplacement = ".conf.new";

/** The names in a folder, sorted; nothing when it cannot be read, none when it is not there. */
std::optional<std::vector<std::string>> NamesIn(const char* folder)
{
    std::error_code error;
    std::vector<std::string> names;
    for (fs::directory_iterator entry(folder, error), end; !error && entry != end;
         entry.increment(error)) {
        names.push_back(entry->path().filename().string());
    }
    if (error && error != std::errc::no_such_file_or_directory) {
        return std::nullopt;
    }
    std::sort(names.begin(), names.end());
    return names;
}

/** A list's replacement may carry a number. */
bool IsListReplacement(std::string_view name)
{
    const auto begin = name.rfind(kListReplacement);
    return begin != std::string_view::npos &&
           name.find_first_not_of("0123456789", begin + kListReplacement.size()) ==
               std::string_view::npos;
}

void ReadConfiguration(HostTruths& truths)
{
    const fs::path folder = vornhost::kConfigurationFolder;
    const auto names = NamesIn(vornhost::kConfigurationFolder);
    if (!names) {
        truths.host.unread.push_back(folder.string() + " cannot be read");
        return;
    }
    for (const std::string& name : *names) {
        const std::string path = folder / name;
        const std::string interface = vornhost::InterfaceOfFileName(name);
        if (name.starts_with(kReplacement)) {
            truths.strays.push_back(path);
        } else if (!interface.empty()) {
            const auto file = vornhost::KeyValueFile::Load(path);
            if (file) {
                truths.files.push_back(FileTruthOf(interface, *file));
            } else {
                truths.host.unread.push_back(path + " cannot be read");
            }
        }
    }
}

void ReadLists(HostTruths& truths)
{
    for (const std::string& name : NamesIn(kListFolder).value_or(std::vector<std::string>())) {
        if (IsListReplacement(name) || name.starts_with(kReplacement)) {
            truths.strays.push_back(std::string(kListFolder) + '/' + name);
        }
    }
}

} // namespace

const FileTruth* HostTruths::FindFile(const std::string& name) const
{
    const auto found = std::find_if(files.begin(), files.end(),
                                    [&](const FileTruth& file) { return file.Name() == name; });
    return found == files.end() ? nullptr : &*found;
}

FileTruth FileTruthOf(const std::string& interface, const vornhost::KeyValueFile& file)
{
    const auto value = [&](const char* key) { return file.Get(key).value_or(""); };
    return {vornhost::ParseInterfaceFile(interface, file.Text()).file, value("DEVICE"),
            value("TYPE"), value("OVS_VLAN_ID")};
}

HostTruths ReadTruths()
{
    HostTruths truths;
    truths.host = ReadHost();
    ReadConfiguration(truths);
    ReadLists(truths);
    for (const vornhost::RememberedBond& bond : vornhost::RememberedBond::LoadAll()) {
        truths.remembered.bonds[bond.name] = {bond.options.Get("mode"), bond.slaves};
    }
    for (const vornhost::RememberedVlan& vlan : vornhost::RememberedVlan::LoadAll()) {
        truths.remembered.vlans.push_back({vlan.parent, static_cast<unsigned>(vlan.id)});
    }
    if (auto record = vornhost::ConversionRecord::Load()) {
        truths.converted = std::move(*record);
    } else {
        truths.host.unread.push_back(std::string(vornhost::kConversionPath) + " cannot be read");
    }
    return truths;
}

} // namespace vornovsctl
