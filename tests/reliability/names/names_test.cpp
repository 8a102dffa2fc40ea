// Every name at every entry point: nothing is written but the files meant, no program takes a name
// for anything else, and nothing ends but the call.
#include "host/client.h"
#include "host/host.h"
#include "names/calls.h"
#include "names/names.h"
#include "support/figures.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <map>

namespace {

namespace fs = std::filesystem;
using reliability::Call;
using reliability::Findings;
using reliability::IfcfgPath;

const std::map<std::string, std::string>& Host()
{
    static const std::map<std::string, std::string> files = {
        {"/usr/vorn/etc/vornovs/ovs_reg.conf", "keeper\n"},
        {reliability::kGatewayPath, "eth0 inet 192.0.2.1\n"},
        {IfcfgPath("eth0"), "DEVICE=eth0\nIPADDR=192.0.2.7\nBRIDGE=ovs_eth0\n"},
        {IfcfgPath("eth1"), "DEVICE=eth1\nBRIDGE=ovs_eth1\n"},
        {IfcfgPath("ovs_eth0"), "DEVICE=ovs_eth0\nIPADDR=192.0.2.7\nTYPE=OVS\nPRIMARY=eth0\n"},
        {IfcfgPath("ovs_eth1"), "DEVICE=ovs_eth1\nTYPE=OVS\nPRIMARY=eth1\n"},
        {IfcfgPath("bystander"), "DEVICE=bystander\nIPADDR=198.51.100.1\n"}};
    return files;
}

/** @return  whether a call with that name may change what is there. */
bool IsMeant(const std::string& path, const std::set<std::string>& interfaces)
{
    if (path == reliability::kLockPath || path.starts_with("/run/vornovs") ||
        path == "/run/fake/calls" || path.starts_with("/usr/vorn/etc/vornnetd/gateways.conf")) {
        return true;
    }
    for (const char* const list : {"reg", "interface", "ignore"}) {
        if (path == std::string(reliability::kStateFolder) + "/ovs_" + list + ".conf") {
            return true;
        }
    }
    return std::any_of(interfaces.begin(), interfaces.end(),
                       [&](const std::string& name) { return path == IfcfgPath(name); });
}

/** Whether a program was called in one of the forms that there are, a name where a name belongs. */
bool IsForm(const std::vector<std::string>& argv)
{
    const std::string verb = argv.size() > 1 ? argv[1] : "";
    if (argv[0] == reliability::kNetworkScript) {
        return verb == "start" || verb == "stop" || (verb == "set-ovs-bond" && argv.size() == 3);
    }
    if (std::find(argv.begin(), argv.end(), "--") != argv.end()) {
        return false;
    }
    if (verb == "add-port" || verb == "del-port") {
        return argv.size() == 4;
    }
    const bool isColumn = argv.size() == 5 && argv[2] == "port" && argv[4].starts_with("tag");
    return verb == "list-br" ? argv.size() == 2
                             : isColumn && (verb == "get" || verb == "set" || verb == "clear");
}

void RunAll(const std::string& name, Findings& findings)
{
    for (const Call& call : reliability::Calls()) {
        const int result = call.run(name);
        findings.Expect(call.documented.empty() || call.documented.contains(result), call.name,
                        std::to_string(result).c_str());
    }
}

class NameTest {
public:
    NameTest() { Restore(); }

    void Try(const std::string& name)
    {
        SCOPED_TRACE(reliability::Printable(name));
        EXPECT_EQ(reliability::RunClient({}, [&](Findings& shared) { RunAll(name, shared); }), "");
        EXPECT_TRUE(reliability::LockIsFree());
        for (const auto& argv : reliability::TakeCalls()) {
            EXPECT_TRUE(IsForm(argv)) << testing::PrintToString(argv);
            ++m_programs;
        }
        std::set<std::string> interfaces = reliability::InterfacesOf(name);
        interfaces.insert({"eth0", "eth1", "ovs_eth0", "ovs_eth1", "ovs_bond7"});
        for (const auto& [path, what] :
             reliability::Differences(m_before, reliability::ReadTree("/"))) {
            EXPECT_TRUE(IsMeant(path, interfaces)) << path << " " << what;
        }
        Restore();
    }
    [[nodiscard]] int Programs() const { return m_programs; }

private:
    void Restore()
    {
        reliability::StartWith(Host());
        fs::remove("/ran");
        m_before = reliability::ReadTree("/");
    }

    reliability::Tree m_before;
    int m_programs = 0;
};

/** The names fall into two halves, so that two processors have something to do. */
class Name : public testing::TestWithParam<size_t> {};

TEST_P(Name, OfAnyKindIsANameAtEveryEntryPoint)
{
    reliability::MakeInterfaces({"ovs_eth0", "ovs_eth1"});
    const std::vector<std::string> names = reliability::Names();
    EXPECT_GE(names.size(), 500U);
    NameTest test;
    size_t tried = 0;
    for (size_t index = GetParam(); index < names.size(); index += 2) {
        test.Try(names[index]);
        ++tried;
    }
    EXPECT_GT(test.Programs(), static_cast<int>(tried));
    reliability::Figure(std::to_string(tried) + " names in each of " +
                        std::to_string(reliability::Calls().size()) +
                        " places: " + std::to_string(tried * reliability::Calls().size()) +
                        " calls, " + std::to_string(test.Programs()) + " programs");
}

INSTANTIATE_TEST_SUITE_P(Halves, Name, testing::Values(0, 1));

} // namespace
