// Services, network, gateways, stores and hook.
#include "faults/scenario.h"

#include <vornovs/vornovs.h>

#include <cerrno>

namespace reliability {

namespace {

using enum Situation;
using VORN::OVS::OVSIfsConf;
using VORN::OVS::OVSRegConf;

const std::vector<std::string> kNames{"eth0", "ovs_eth1"};

std::vector<Scenario> Services()
{
    std::vector<Scenario> scenarios{
        {"IsDaemonAlive", kOnSwitch, [] { return AsInt(VORN::OVS::IsDaemonAlive()); }, 1, {0}},
        {"StartOVSDaemon",
         kPlain,
         [] { return AsInt(VORN::OVS::StartOVSDaemon()); },
         1,
         {0},
         {{"VLIBServiceStart", 0}}},
        {"StopOVSBaemon",
         kOnSwitch,
         [] { return AsInt(VORN::OVS::StopOVSBaemon()); },
         1,
         {0},
         {{"VLIBServiceStop", 0}}},
        {"IsInterfaceExist",
         kOnSwitch,
         [] { return AsInt(VORN::OVS::IsInterfaceExist("eth0")); },
         1,
         {0}},
    };
    scenarios.front().silent = scenarios.back().silent = true;
    return scenarios;
}

std::vector<Scenario> Network()
{
    std::vector<Scenario> scenarios{
        {"StartNetwork", kOnSwitch, [] { return AsInt(VORN::OVS::StartNetwork(kNames)); }, 1},
        {"StopNetwork", kOnSwitch, [] { return AsInt(VORN::OVS::StopNetwork(kNames)); }, 1},
    };
    for (Scenario& scenario : scenarios) {
        scenario.failures = {0};
        scenario.fatal = {{"VLIBCExecv", 0}};
        // Whoever called says what did not start.
        scenario.own = {{"VLIBCExecv", "", {{1, Then::kUnsaid, ""}, {-1, Then::kUnsaid, ""}}}};
        scenario.silent = scenario.mayStayStopped = true;
    }
    scenarios.push_back({"CopyGatewayInfo",
                         kPlain,
                         [] { return VORN::OVS::CopyGatewayInfo("eth0", "ovs_eth0"); },
                         0,
                         {-1},
                         {{"VLIBCExecl", -1}}});
    scenarios.push_back({"RemoveGateWayInfo",
                         kPlain,
                         [] { return VORN::OVS::RemoveGateWayInfo("eth0"); },
                         0,
                         {-1},
                         {{"VLIBCExec", -1}}});
    return scenarios;
}

template <typename Action>
std::function<int()> OnRegistry(Action act)
{
    return [act] {
        OVSRegConf registry;
        const int loaded = registry.LoadFromConfig();
        return loaded < 0 ? loaded : act(registry);
    };
}

std::vector<Scenario> Registry()
{
    std::vector<Scenario> scenarios{
        {"OVSRegConfLoad", kOnSwitch, OnRegistry([](OVSRegConf&) { return 0; }), 0},
        {"OVSRegConfRegister", kOnSwitch,
         OnRegistry([](OVSRegConf& store) { return store.Register(kOther); }), 0},
        {"OVSRegConfUnRegister", kOnSwitch,
         OnRegistry([](OVSRegConf& store) { return store.UnRegister(kClient); }), 0},
        {"OVSRegConfUnRegisterOneOfTwo", kShared,
         OnRegistry([](OVSRegConf& store) { return store.UnRegister(kClient); }), 0},
        {"OVSRegConfIsRegister", kOnSwitch,
         OnRegistry([](OVSRegConf& store) { return store.IsRegister(kClient) - 1; }), 0},
        {"OVSRegConfWriteToConfig", kOnSwitch,
         OnRegistry([](OVSRegConf& store) { return store.WriteToConfig(); }), 0},
        {"OVSRegConfCheckAndMkdir", kOnSwitch, [] { return OVSRegConf().CheckAndMkdir(); }, 0},
    };
    for (Scenario& scenario : scenarios) {
        scenario.failures = {-1, 2, -2};
        scenario.fatal = {{kFailsToWrite, -1}};
    }
    scenarios.back().fatal = {{"VLIBCFileCheckDir", -1}, {"mkdir", -1}};
    return scenarios;
}

template <typename Action>
std::function<int()> OnList(Action act)
{
    return [act] {
        std::string path;
        {
            const harness::HarnessAllocations guard;
            path = unit::kInterfaceList;
        }
        OVSIfsConf list(std::move(path));
        return act(list);
    };
}

std::vector<Scenario> Lists()
{
    std::vector<Scenario> scenarios{
        {"OVSIfsConf", kOnSwitch, OnList([](OVSIfsConf&) { return 0; }), 0},
        {"OVSIfsConfLoad", kOnSwitch,
         OnList([](OVSIfsConf& list) { return list.LoadFromConfig(); }), 0},
        {"OVSIfsConfWrite", kOnSwitch, OnList([](OVSIfsConf& list) { return list.Write("eth9"); }),
         0},
        {"OVSIfsConfWriteFirst", kPlain,
         OnList([](OVSIfsConf& list) { return list.Write("eth9"); }), 0},
        {"OVSIfsConfRemove", kOnSwitch,
         OnList([](OVSIfsConf& list) { return list.Remove("eth0"); }), 0},
        {"OVSIfsConfWriteToConfig", kOnSwitch, OnList([](OVSIfsConf& list) {
             const harness::HarnessAllocations guard;
             return list.WriteToConfig({"eth0"});
         }),
         0},
        {"OVSIfsConfCheckAndMkdir", kOnSwitch,
         OnList([](OVSIfsConf& list) { return list.CheckAndMkdir(); }), 0},
    };
    for (Scenario& scenario : scenarios) {
        scenario.failures = {-1};
        // A list that cannot be read counts as empty.
        scenario.fatal = {{"open-read", 0}, {unit::kInterfaceList, -1}};
    }
    // This one reads the list a second time.
    scenarios[1].own = {{"open-read", "", {{EIO, Then::kTold, " Open "}}}};
    scenarios[4].fatal.erase(scenarios[4].fatal.begin());
    return scenarios;
}

std::vector<Scenario> Hook()
{
    return {{"OVSChangeHook", kPlain,
             [] {
                 std::optional<VORN::OVS::OVSChangeHook> hook;
                 try {
                     hook.emplace("create");
                 } catch (const std::bad_alloc&) {
                     return 0; // a constructor has no other way of saying so
                 }
                 (void)hook->ExecHook(SDK_PLUGIN_ACTION_BEGIN);
                 return 0;
             },
             0}};
}

} // namespace

std::vector<Scenario> Helpers()
{
    std::vector<Scenario> all;
    for (auto& part : {Services(), Network(), Registry(), Lists(), Hook()}) {
        all.insert(all.end(), part.begin(), part.end());
    }
    return all;
}

} // namespace reliability
