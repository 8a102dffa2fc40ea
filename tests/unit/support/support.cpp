#include "support/support.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <utility>

#include <sys/mount.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

namespace unit {

namespace fs = std::filesystem;

namespace {

void Empty(const fs::path& folder)
{
    for (const auto& entry : fs::directory_iterator(folder)) {
        fs::remove_all(entry.path());
    }
}

bool IsInSandbox()
{
    std::ifstream mounts("/proc/self/mounts");
    for (std::string line; std::getline(mounts, line);) {
        if (line.starts_with("sandbox / tmpfs ")) {
            return true;
        }
    }
    return false;
}

/** Gives each test empty folders, and a machine that nothing of it can reach. */
class FreshFolders : public testing::EmptyTestEventListener {
    void OnTestStart(const testing::TestInfo& /*info*/) override
    {
        if (!IsInSandbox()) {
            (void)std::fprintf(stderr, "unit tests run in the sandbox only\n");
            std::abort();
        }
        RenewFolders();
    }
};

[[maybe_unused]] const bool kListens = [] {
    testing::UnitTest::GetInstance()->listeners().Append(new FreshFolders);
    return true;
}();

void Check(bool succeeded, const std::string& step)
{
    if (!succeeded) {
        ADD_FAILURE() << step << ": " << std::strerror(errno);
    }
}

} // namespace

void RenewFolders()
{
    Empty("/usr/vorn");
    Empty("/etc/sysconfig");
    fs::create_directories(kStateFolder);
    fs::create_directories("/etc/sysconfig/network-scripts");
}

const std::string& LongName()
{
    static const std::string name(5000, 'x');
    return name;
}

void WriteFile(const std::string& path, const std::string& text)
{
    std::ofstream file(path);
    file << text << std::flush;
    Check(file.good(), "writing " + path);
}

std::optional<std::string> ReadFile(const std::string& path)
{
    std::ifstream file(path);
    if (!file) {
        return std::nullopt;
    }
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

std::vector<std::string> Words(const std::string& text)
{
    std::istringstream stream(text);
    std::vector<std::string> words;
    for (std::string word; stream >> word;) {
        words.push_back(word);
    }
    return words;
}

std::vector<std::string> ListFolder(const std::string& path)
{
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(path)) {
        names.push_back(entry.path().filename());
    }
    std::sort(names.begin(), names.end());
    return names;
}

void MakeUnopenable(const std::string& path)
{
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    ASSERT_LT(path.size(), sizeof(address.sun_path));
    path.copy(address.sun_path, sizeof(address.sun_path) - 1);
    const int descriptor = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    Check(bind(descriptor, reinterpret_cast<const sockaddr*>(&address), sizeof(address)) == 0,
          "binding " + path);
    (void)close(descriptor);
}

Calls GatewaysCopied(const std::string& from, const std::string& to)
{
    const std::string tool = "VLIBCExecl /usr/vorn/sbin/vornnetdtool --copy-gateway-info ";
    return {tool + "-4 " + from + " " + to, tool + "-6 " + from + " " + to};
}

Calls InterfaceListLoaded()
{
    return {"VLIBCFileCheckDir /usr/vorn/etc/vornovs",
            "VLIBCFileExist /usr/vorn/etc/vornovs/ovs_interface.conf"};
}

Calls BridgeMade(const std::string& name)
{
    const std::string bridge = "ovs_" + name;
    const std::string plainFile = kIfcfg + name;
    const std::string bridgeFile = kIfcfg + bridge;
    return Sequence({InterfaceListLoaded(),
                     {"VLIBCExec /bin/cp -f " + plainFile + " " + bridgeFile,
                      "VLIBCFileSetKeys " + bridgeFile + " DEVICE=" + bridge +
                          " TYPE=OVS PRIMARY=" + name + " -BONDING_OPTS -BRIDGE -SLAVE",
                      "VLIBCFileSetKeys " + plainFile + " BRIDGE=" + bridge,
                      "VLIBCFileCheckDir /usr/vorn/etc/vornovs"}});
}

Calls BridgeDissolved(const std::string& name, bool listed)
{
    const std::string plainFile = kIfcfg + name;
    const std::string bridgeFile = std::string(kIfcfg) + "ovs_" + name;
    return Sequence(
        {InterfaceListLoaded(),
         {"VLIBCExec /bin/cp -f " + bridgeFile + " " + plainFile, "VLIBCFileExist " + bridgeFile,
          "VLIBCFileSetKeys " + plainFile + " DEVICE=" + name + " -TYPE -PRIMARY"},
         listed ? Calls{"VLIBCFileCheckDir /usr/vorn/etc/vornovs"} : Calls{}});
}

Calls Sequence(std::initializer_list<Calls> pieces)
{
    Calls all;
    for (const Calls& piece : pieces) {
        all.insert(all.end(), piece.begin(), piece.end());
    }
    return all;
}

ScopedMount::ScopedMount(std::string folder, const std::string& options)
    : m_folder(std::move(folder))
{
    Check(mount("unit", m_folder.c_str(), "tmpfs", 0, options.c_str()) == 0,
          "mounting " + m_folder);
}

ScopedMount::~ScopedMount()
{
    Check(umount2(m_folder.c_str(), MNT_DETACH) == 0, "unmounting " + m_folder);
}

void ScopedMount::MakeReadOnly()
{
    Check(mount(nullptr, m_folder.c_str(), nullptr, MS_REMOUNT | MS_RDONLY, nullptr) == 0,
          "remounting " + m_folder);
}

} // namespace unit
