#include "adopt/silencers.h"

#include "adopt/ifupdownreader.h"
#include "adopt/inifile.h"
#include "hands.h"

#include <algorithm>
#include <array>

namespace vornovsctl {

namespace {

// Of several files that match an interface the first one by name counts.
constexpr char kNetworkName[] = "00-0-vornovs.network";
constexpr char kNetworkFolder[] = "/etc/systemd/network/";
constexpr char kNetdevDropIn[] = "/etc/systemd/network/%.d/00-vornovs.conf";
// Read last, so that it can add to what others say.
constexpr char kKeyfilePath[] = "/etc/NetworkManager/conf.d/zz-vornovs.conf";

// Otherwise it may write what was commented out anew.
constexpr char kCloudPath[] = "/etc/cloud/cloud.cfg.d/99-vornovs-network.cfg";
constexpr char kCloudFolder[] = "/etc/cloud/cloud.cfg.d";
constexpr char kCloudText[] = "network: {config: disabled}\n";

/** What the switch and its network program make. */
constexpr std::array kSwitchDevices{"ovs_*", "ovs-system", "tag*.*"};

constexpr char kHeader[] = "# Written by 'vornovsctl adopt', removed by 'vornovsctl release'.\n";

bool IsInstalled(const HostView& host, std::initializer_list<const char*> paths)
{
    return std::any_of(paths.begin(), paths.end(),
                       [&](const char* path) { return host.Exists(path); });
}

std::string NetworkText(const std::set<std::string>& names)
{
    std::string list;
    for (const std::string& name : names) {
        list += name + ' ';
    }
    for (const char* const pattern : kSwitchDevices) {
        list += pattern + std::string(" ");
    }
    list.pop_back();
    return std::string(kHeader) + "[Match]\nName=" + list + "\n\n[Link]\nUnmanaged=yes\n";
}

std::string KeyfileText(const std::set<std::string>& names)
{
    std::string list;
    for (const std::string& name : names) {
        list += "interface-name:" + name + ';';
    }
    for (const char* const pattern : kSwitchDevices) {
        list += std::string("interface-name:") + pattern + ';';
    }
    list.pop_back();
    return std::string(kHeader) + "[keyfile]\nunmanaged-devices+=" + list + '\n';
}

/** On a condition that no host meets: the device is not made. */
std::string NetdevText()
{
    return std::string(kHeader) + "[Match]\nKernelCommandLine=vornovs.release\n";
}

void AddInterfacesFiles(const HostView& host, const std::set<std::string>& names,
                        std::vector<SilencingFile>& files)
{
    bool byCloud = false;
    for (const std::string& path : ReadInterfaces(host).paths) {
        const auto text = host.Text(path);
        if (text && WithoutInterfaces(*text, names) != *text) {
            files.push_back({Silencer::kInterfaces, path, "", std::nullopt});
            byCloud = byCloud || path.find("cloud-init") != std::string::npos;
        }
    }
    if (byCloud && host.Exists(kCloudFolder)) {
        files.push_back({Silencer::kCloud, kCloudPath, "", std::nullopt});
    }
}

void AddNetdevFiles(const HostView& host, const std::set<std::string>& names,
                    std::vector<SilencingFile>& files)
{
    std::set<std::string> seen;
    for (const char* folder : {"/etc/systemd/network/", "/run/systemd/network/",
                               "/usr/local/lib/systemd/network/", "/usr/lib/systemd/network/"}) {
        for (const std::string& path : host.Find(std::string(folder) + "*.netdev")) {
            const std::string name = path.substr(path.rfind('/') + 1);
            std::string device;
            for (const IniSection& section : ParseIni(host.Text(path).value_or(""))) {
                device = section.name == "NetDev" ? section.Get("Name") : device;
            }
            if (names.contains(device) && seen.insert(name).second) {
                std::string dropIn = kNetdevDropIn;
                dropIn.replace(dropIn.find('%'), 1, name);
                files.push_back({Silencer::kNetdev, dropIn, device, std::nullopt});
            }
        }
    }
}

std::string FolderOf(const std::string& path)
{
    return path.substr(0, path.rfind('/'));
}

void Settle(const SilencingFile& file, const std::set<std::string>& names, Hands& hands)
{
    const auto now = hands.Read(file.path);
    const auto wanted = SilencingText(file, now ? std::optional(now->text) : std::nullopt, names);
    const bool asBefore = file.before && wanted == file.before->text;
    if (asBefore) {
        hands.Restore(file.path, *file.before);
    } else if (!wanted) {
        hands.Remove(file.path);
        if (file.kind == Silencer::kNetdev) {
            hands.RemoveEmptyFolder(FolderOf(file.path));
        }
    } else if (!now || now->text != *wanted) {
        hands.Write(file.path, *wanted, file.before ? file.before->mode : kReadableMode);
    }
}

} // namespace

std::vector<SilencingFile> SilencersFor(const HostView& host, const Hands& hands,
                                        const std::set<std::string>& names)
{
    std::vector<SilencingFile> files;
    AddInterfacesFiles(host, names, files);
    if (IsInstalled(host, {"/usr/lib/systemd/systemd-networkd", "/lib/systemd/systemd-networkd"})) {
        files.push_back(
            {Silencer::kNetwork, std::string(kNetworkFolder) + kNetworkName, "", std::nullopt});
        AddNetdevFiles(host, names, files);
    }
    if (IsInstalled(host, {"/usr/sbin/NetworkManager"})) {
        files.push_back({Silencer::kKeyfile, kKeyfilePath, "", std::nullopt});
    }
    for (SilencingFile& file : files) {
        file.before = hands.Read(file.path);
    }
    return files;
}

std::optional<std::string> SilencingText(const SilencingFile& file,
                                         const std::optional<std::string>& now,
                                         const std::set<std::string>& names)
{
    switch (file.kind) {
    case Silencer::kInterfaces:
        // What was edited meanwhile stays.
        return now ? std::optional(WithoutInterfaces(WithInterfacesAgain(*now), names)) : now;
    case Silencer::kNetwork:
        return names.empty() ? std::nullopt : std::optional(NetworkText(names));
    case Silencer::kNetdev:
        return names.contains(file.device) ? std::optional(NetdevText()) : std::nullopt;
    case Silencer::kKeyfile:
        return names.empty() ? std::nullopt : std::optional(KeyfileText(names));
    case Silencer::kCloud:
        return names.empty() ? std::nullopt : std::optional(std::string(kHeader) + kCloudText);
    }
    return std::nullopt;
}

void SettleSilencers(const AdoptionRecord& record, const std::set<std::string>& names, Hands& hands)
{
    for (const SilencingFile& file : record.silencers) {
        Settle(file, names, hands);
    }
}

std::string NetworkFileObstacle(const std::string& networkFile)
{
    const std::string name = networkFile.substr(networkFile.rfind('/') + 1);
    return name < kNetworkName ? networkFile + " comes before " + kNetworkName +
                                     " by its name, so that it would count: rename it"
                               : "";
}

} // namespace vornovsctl
