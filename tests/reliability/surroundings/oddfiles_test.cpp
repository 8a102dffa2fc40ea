// Files of the library that are none, are somebody's, or say things that nobody would write.
#include "host/client.h"
#include "host/host.h"
#include "support/figures.h"
#include "surroundings/operations.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <functional>

#include <sys/mount.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>
#include <vornovs/vornovs.h>

namespace {

namespace fs = std::filesystem;
using reliability::Files;
using reliability::IfcfgPath;
using reliability::Operation;
using reliability::Outcome;
using reliability::ReadFile;
using reliability::WriteFile;

constexpr char kElsewhere[] = "/usr/vorn/elsewhere";
constexpr uid_t kSomebody = 65534;

/** What a file can be; made of the file that is there, whose text it keeps where it has one. */
struct Kind {
    const char* name;
    std::function<void(const std::string& path, const std::string& text)> make;
};

void MakeSocket(const std::string& path)
{
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    path.copy(address.sun_path, sizeof address.sun_path - 1);
    const int socket = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    EXPECT_EQ(::bind(socket, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
    (void)::close(socket);
}

void BindFile(const std::string& path, const std::string& text)
{
    WriteFile(kElsewhere, text);
    WriteFile(path, "");
    EXPECT_EQ(::mount(kElsewhere, path.c_str(), nullptr, MS_BIND, nullptr), 0);
}

const std::vector<Kind>& SpecialKinds()
{
    static const std::vector<Kind> kinds = {
        {"a folder", [](const auto& path, const auto&) { fs::create_directory(path); }},
        {"a folder with something in it",
         [](const auto& path, const auto&) { WriteFile(path + "/file", "text\n"); }},
        {"a FIFO",
         [](const auto& path, const auto&) { EXPECT_EQ(::mkfifo(path.c_str(), 0600), 0); }},
        {"a socket", [](const auto& path, const auto&) { MakeSocket(path); }},
        {"a link to nothing",
         [](const auto& path, const auto&) { fs::create_symlink("/usr/vorn/nothing", path); }},
        {"a link to itself", [](const auto& path, const auto&) { fs::create_symlink(path, path); }},
        {"a link to a folder",
         [](const auto& path, const auto&) { fs::create_symlink("/usr/vorn/sbin", path); }},
        {"a link to /dev/null",
         [](const auto& path, const auto&) { fs::create_symlink("/dev/null", path); }},
        {"a link to /dev/full",
         [](const auto& path, const auto&) { fs::create_symlink("/dev/full", path); }}};
    return kinds;
}

const std::vector<Kind>& FileKinds()
{
    static const std::vector<Kind> kinds = {
        {"a link to a file",
         [](const auto& path, const auto& text) {
             WriteFile(kElsewhere, text);
             fs::create_symlink(kElsewhere, path);
         }},
        {"another name of a file",
         [](const auto& path, const auto& text) {
             WriteFile(kElsewhere, text);
             fs::create_hard_link(kElsewhere, path);
         }},
        {"mounted", BindFile},
        {"somebody else's",
         [](const auto& path, const auto& text) {
             WriteFile(path, text);
             EXPECT_EQ(::chown(path.c_str(), kSomebody, kSomebody), 0);
         }},
        {"closed to everybody",
         [](const auto& path, const auto& text) { WriteFile(path, text, 0); }},
        {"open to everybody",
         [](const auto& path, const auto& text) { WriteFile(path, text, 0666); }}};
    return kinds;
}

/** Lines that are no reason to lose them or any other. */
const std::vector<std::pair<const char*, std::string>>& OddTexts()
{
    static const std::vector<std::pair<const char*, std::string>> texts = {
        {"nothing", ""},
        {"line breaks of another system", "FIRST=1\r\nSECOND=2\r\n"},
        {"NUL bytes", std::string("FIRST=1\nNUL=a\0b\n\0\n", 18)},
        {"the same key again", "FIRST=1\nFIRST=2\nFIRST=3\n"},
        {"a megabyte in one line", "LONG=" + std::string(1 << 20, 'x') + "\nFIRST=1\n"},
        {"two thousand lines",
         [] {
             std::string text;
             for (int line = 0; line < 2000; ++line) {
                 text += "KEY" + std::to_string(line) + "=1\n";
             }
             return text;
         }()},
        {"bytes of no encoding", "FIRST=\xff\xfe\x80\n\xc3\x28=1\n"},
        {"no line break at its end", "FIRST=1\nSECOND=2"},
        {"lines that say nothing", "\n\n=\n=value\n#KEY=1\nKEY\n   \nKEY =1\n \tKEY=1\n"},
        {"quotes that do not end", "FIRST=\"1\nSECOND='2\nTHIRD=\"\"\"\n"},
        {"what a shell would run",
         "FIRST=$(touch /ran)\nSECOND=`touch /ran`\nTHIRD=;touch /ran\n"}};
    return texts;
}

void Remove(const std::string& path)
{
    (void)::umount2(path.c_str(), MNT_DETACH | UMOUNT_NOFOLLOW);
    fs::remove_all(path);
    fs::remove_all(kElsewhere);
    fs::remove_all("/usr/vorn/nothing");
    fs::create_directories(fs::path(path).parent_path());
}

mode_t TypeOf(const std::string& path)
{
    struct stat status {};
    return ::lstat(path.c_str(), &status) == 0 ? status.st_mode & S_IFMT : 0;
}

/** The files that operations meet, each with those that do. */
const std::vector<std::pair<std::string, std::vector<std::string>>>& Meetings()
{
    static const std::vector<std::pair<std::string, std::vector<std::string>>> meetings = {
        {reliability::kRegistrations, {"Register", "UnRegister", "AttachPort", "OVSSetDefault"}},
        {reliability::kInterfaces, {"Register, the first", "UnRegister", "OVSSetDefault"}},
        {reliability::kIgnored, {"AddInterface", "OVSSetDefault"}},
        {IfcfgPath("eth0"), {"Register, the first", "UnRegister", "OVSBondCreate"}},
        {IfcfgPath("ovs_eth0"), {"UnRegister", "OVSVlanCreate", "OVSVlanRemove", "OVSBondCreate"}},
        {IfcfgPath("ovs_bond0"), {"OVSBodChMode", "OVSBondRemove"}},
        {reliability::kGatewayPath, {"Register, the first", "UnRegister"}},
        {"/etc/vorninfo.conf", {"Register, the first", "UnRegister"}},
        {reliability::kStateFolder, {"Register", "Register, the first", "AddInterface"}},
        {reliability::kLockPath, {"Register", "AttachPort"}}};
    return meetings;
}

std::string TextAt(const Operation& operation, const std::string& path)
{
    const auto found = operation.start.find(path);
    return found == operation.start.end() ? "" : found->second;
}

bool HasAddress(const Files& files)
{
    return std::any_of(files.begin(), files.end(), [](const auto& file) {
        return file.second.find("IPADDR=192.0.2.7") != std::string::npos;
    });
}

Files WithoutFile(Files files, const std::string& path)
{
    files.erase(path);
    return files;
}

/** Documented, in time, without a trace in the process, and over: whatever the file is. */
void ExpectAnswered(const Operation& operation, const Outcome& outcome,
                    std::chrono::steady_clock::time_point begin)
{
    EXPECT_TRUE(operation.documented.contains(outcome.result)) << outcome.result;
    EXPECT_EQ(outcome.findings, "");
    EXPECT_TRUE(reliability::LockIsFree());
    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(20));
    EXPECT_FALSE(fs::exists("/ran"));
}

class OddFiles : public testing::Test {
protected:
    static void SetUpTestSuite() { reliability::LearnEnds(); }
};

TEST_F(OddFiles, ThatAreNoFilesHoldNobodyUpAndAreNotReplacedByFiles)
{
    int tried = 0;
    for (const auto& [path, operations] : Meetings()) {
        for (const Kind& kind : SpecialKinds()) {
            for (const std::string& name : operations) {
                SCOPED_TRACE(name + ", " + path + " is " + kind.name);
                const Operation& operation = reliability::OperationCalled(name);
                reliability::StartWith(operation.start);
                Remove(path);
                kind.make(path, "");
                const mode_t type = TypeOf(path);
                const auto begin = std::chrono::steady_clock::now();
                const Outcome outcome = reliability::Run(operation);
                ExpectAnswered(operation, outcome, begin);
                EXPECT_TRUE(HasAddress(outcome.files) ||
                            !HasAddress(WithoutFile(operation.start, path)))
                    << "the host's address is lost";
                // The lock's file is the one that is put right, for it is nobody's but ours.
                const bool stays = path != reliability::kLockPath && type != S_IFLNK &&
                                   name != "OVSSetDefault" && TypeOf(path) != 0;
                EXPECT_TRUE(!stays || TypeOf(path) == type) << TypeOf(path);
                Remove(path);
                ++tried;
            }
        }
    }
    EXPECT_TRUE(fs::is_character_file("/dev/null") && fs::is_character_file("/dev/full"));
    reliability::Figure(std::to_string(tried) + " surroundings with a file that is none");
}

/** The library's own file is not looked into through the link that it is. */
Files Followed(Files files, const std::string& path)
{
    if (fs::is_symlink(path) && fs::exists(path)) {
        files[path] = ReadFile(path);
    }
    return files;
}

TEST_F(OddFiles, OfAnotherKindOrOwnerAreServedLikeAnyOther)
{
    int tried = 0;
    for (const auto& [path, operations] : Meetings()) {
        for (const Kind& kind : FileKinds()) {
            for (const std::string& name : operations) {
                const Operation& operation = reliability::OperationCalled(name);
                if (!operation.start.contains(path)) {
                    continue;
                }
                SCOPED_TRACE(name + ", " + path + " is " + kind.name);
                reliability::StartWith(operation.start);
                Remove(path);
                kind.make(path, TextAt(operation, path));
                const auto begin = std::chrono::steady_clock::now();
                Outcome outcome = reliability::Run(operation);
                ExpectAnswered(operation, outcome, begin);
                outcome.files = Followed(outcome.files, path);
                reliability::ExpectSound(operation, outcome);
                Remove(path);
                ++tried;
            }
        }
    }
    reliability::Figure(std::to_string(tried) +
                        " surroundings with a file behind a link, mounted or somebody else's");
}

/** What a tag that comes and goes leaves. */
std::string AfterATag(reliability::Findings& findings)
{
    findings.Expect(VORN::OVS::OVSVlanCreate("ovs_eth0", "7") == 0, "OVSVlanCreate");
    const std::string text = "\n" + ReadFile(IfcfgPath("ovs_eth0"));
    findings.Expect(text.find("\nOVS_VLAN_ID=7") != std::string::npos,
                    "the tag is not in the file");
    findings.Expect(VORN::OVS::OVSVlanRemove("ovs_eth0") == 0, "OVSVlanRemove");
    return ReadFile(IfcfgPath("ovs_eth0"));
}

TEST_F(OddFiles, KeepEveryByteThatIsNotTheLibrarys)
{
    int tried = 0;
    for (const auto& [name, text] : OddTexts()) {
        SCOPED_TRACE(name);
        Files files = reliability::HostOnSwitch();
        files[IfcfgPath("ovs_eth0")] = text;
        reliability::StartWith(files);
        EXPECT_EQ(reliability::RunClient({},
                                         [&before = text](reliability::Findings& findings) {
                                             findings.Expect(AfterATag(findings) == before,
                                                             "the file is not what it was");
                                         }),
                  "");
        ++tried;
    }
    EXPECT_FALSE(fs::exists("/ran"));
    reliability::Figure(std::to_string(tried) + " odd configuration files kept byte for byte");
}

TEST_F(OddFiles, OfAnyTextAreNoReasonToHangOrToLoseAnAddress)
{
    int tried = 0;
    for (const auto& [path, operations] : Meetings()) {
        for (const auto& [kind, text] : OddTexts()) {
            for (const std::string& name : operations) {
                const Operation& operation = reliability::OperationCalled(name);
                if (!operation.start.contains(path) && path != "/etc/vorninfo.conf") {
                    continue;
                }
                SCOPED_TRACE(name + ", " + path + " says " + kind);
                reliability::StartWith(operation.start);
                WriteFile(path, text + TextAt(operation, path));
                const auto begin = std::chrono::steady_clock::now();
                const Outcome outcome = reliability::Run(operation);
                ExpectAnswered(operation, outcome, begin);
                EXPECT_TRUE(HasAddress(outcome.files)) << "the host's address is lost";
                Remove(path);
                ++tried;
            }
        }
    }
    reliability::Figure(std::to_string(tried) + " surroundings with a file of odd text");
}

} // namespace
