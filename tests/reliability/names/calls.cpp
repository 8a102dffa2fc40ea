#include "names/calls.h"

#include <vornovs/vornovs.h>

namespace reliability {
namespace {

using namespace VORN::OVS; // NOLINT: the library's own names
using Name = const std::string&;

constexpr auto kSlb = VORN_LINK_AGGR_OVS_BALANCE_SLB;
constexpr char kBridge[] = "ovs_eth0";
constexpr char kIgnored[] = "/usr/vorn/etc/vornovs/ovs_ignore.conf";

const std::set<int> kZeroOrFailed = {0, -1};

/** The slaves' bridges exist, so that only the master's name is in question. */
int CreateBond(Name master, bool locked)
{
    std::vector<std::string> slaves = {"eth0", "eth1"};
    return locked ? OVSBondCreate(kSlb, master, slaves)
                  : BondManager::Create(kSlb, master, slaves, false) - 1;
}

int CreateBondOf(Name slave, bool first)
{
    std::vector<std::string> slaves = {first ? slave : "eth0", first ? "eth0" : slave};
    return OVSBondCreate(kSlb, "ovs_bond7", slaves);
}

int RemoveBond(Name bond, bool locked)
{
    VORNLINKAGGROPT record{};
    return locked ? OVSBondRemove(bond, &record) : BondManager::Remove(bond, &record, false) - 1;
}

int ReadBond(Name bond)
{
    VORNLINKAGGROPT record{};
    return OVSBondGet(bond, &record);
}

int ReadTag(Name port)
{
    _tag_VLIB_VLAN record{};
    const int result = OVSVlanGet(port, &record);
    return record.szIfName[sizeof record.szIfName - 1] == '\0' ? result : -100;
}

int ExecHook(Name action)
{
    OVSChangeHook hook(action);
    (void)hook.ExecHook(SDK_PLUGIN_ACTION_BEGIN);
    return 0;
}

int SaveNames(Name name)
{
    OVSIfsConf list(kIgnored);
    return list.WriteToConfig({name, "eth9"}) | list.WriteToConfig({});
}

int UseRegistry(Name name)
{
    OVSRegConf registry;
    (void)registry.LoadFromConfig();
    const int registered = registry.Register(name);
    return registered == 1 || registry.IsRegister(name) != 1 ? registered
                                                             : registry.UnRegister(name);
}

/** A conversion that ends at once, for the host shows no interface that could be converted. */
int Convert(Name bond, Name mode)
{
    OVSSetDefault();
    const int result = Register("first", {{bond, mode}});
    (void)OVSRegConf().Register("keeper");
    return result;
}

void AddStores(std::vector<Call>& calls)
{
    calls.insert(
        calls.end(),
        {{"IsRegister", [](Name name) { return IsRegister(name); }, kZeroOrFailed},
         {"Register", [](Name name) { return Register(name, {}); }, {0, 1, -1}},
         {"UnRegister",
          [](Name name) { return name == "keeper" ? 0 : UnRegister(name, {}); },
          {0, 1, -1}},
         {"OVSRegConf", UseRegistry, {0, 1, -1}},
         {"OVSIfsConf::Write", [](Name name) { return OVSIfsConf(kIgnored).Write(name); },
          kZeroOrFailed},
         {"OVSIfsConf::Remove", [](Name name) { return OVSIfsConf(kIgnored).Remove(name); },
          kZeroOrFailed},
         {"OVSIfsConf::WriteToConfig", SaveNames, kZeroOrFailed},
         {"StrToMode", [](Name name) { return static_cast<int>(StrToMode(name.c_str())); }, {}},
         {"BondManager::StrToMode",
          [](Name name) { return static_cast<int>(BondManager::StrToMode(name)); },
          {}},
         {"IsInterfaceExist", [](Name name) { return IsInterfaceExist(name) ? 1 : 0; }, {0, 1}},
         {"OVSChangeHook", ExecHook, {0}},
         {"InitBondOpt", [](Name name) { return OVSManager().InitBondOpt(name); }, {0}},
         {"InitBondOpt with a mode",
          [](Name name) { return OVSManager().InitBondOpt(name, "802.3ad"); },
          {0}},
         {"InitBondOpt with the mode",
          [](Name name) { return OVSManager().InitBondOpt("bond0", name); },
          {0}}});
}

void AddPorts(std::vector<Call>& calls)
{
    const std::set<int> ported = {1, 0, -1};
    calls.insert(
        calls.end(),
        {{"AttachPort, bridge", [](Name name) { return AttachPort(name, "tap0"); }, ported},
         {"AttachPort, port", [](Name name) { return AttachPort(kBridge, name); }, ported},
         {"DetachPort, bridge", [](Name name) { return DetachPort(name, "tap0"); }, ported},
         {"DetachPort, port", [](Name name) { return DetachPort(kBridge, name); }, ported},
         {"OVSManager::AttachPort",
          [](Name name) { return OVSManager().AttachPort(name, name) ? 1 : 0; },
          {0, 1}},
         {"OVSManager::DetachPort",
          [](Name name) { return OVSManager().DetachPort(name, name) ? 1 : 0; },
          {0, 1}},
         {"OVSVlanGet", ReadTag, {1, 0, -1}},
         {"OVSVlanSet, port", [](Name name) { return OVSVlanSet(name, "5"); }, kZeroOrFailed},
         {"OVSVlanSet, tag", [](Name name) { return OVSVlanSet(kBridge, name); }, kZeroOrFailed},
         {"OVSVlanClear", [](Name name) { return OVSVlanClear(name); }, kZeroOrFailed},
         {"OVSVlanCreate, port", [](Name name) { return OVSVlanCreate(name, "5"); }, kZeroOrFailed},
         {"OVSVlanRemove", [](Name name) { return OVSVlanRemove(name); }, kZeroOrFailed},
         {"OVSVlanCreate, tag", [](Name name) { return OVSVlanCreate(kBridge, name); },
          kZeroOrFailed},
         {"VlanManager::Remove", [](Name) { return VlanManager::Remove(kBridge); },
          kZeroOrFailed}});
}

void AddInterfaces(std::vector<Call>& calls)
{
    calls.insert(
        calls.end(),
        {{"RemoveInterface", [](Name name) { return RemoveInterface(name); }, kZeroOrFailed},
         {"AddInterface", [](Name name) { return AddInterface(name); }, kZeroOrFailed},
         {"CreateOVS", [](Name name) { return OVSManager().CreateOVS(name); }, kZeroOrFailed},
         {"DestroyOVS", [](Name name) { return OVSManager().DestroyOVS("ovs_" + name); },
          kZeroOrFailed},
         {"DestroyOVS, whole name", [](Name name) { return OVSManager().DestroyOVS(name); },
          kZeroOrFailed},
         {"StartNetwork", [](Name name) { return StartNetwork({name}) ? 1 : 0; }, {0, 1}},
         {"StopNetwork",
          [](Name name) {
              return StopNetwork({"eth0", name}) ? 1 : 0;
          },
          {0, 1}},
         {"CopyGatewayInfo, from", [](Name name) { return CopyGatewayInfo(name.c_str(), "eth7"); },
          kZeroOrFailed},
         {"CopyGatewayInfo, to", [](Name name) { return CopyGatewayInfo("eth0", name.c_str()); },
          kZeroOrFailed},
         {"RemoveGateWayInfo", [](Name name) { return RemoveGateWayInfo(name.c_str()); },
          kZeroOrFailed}});
}

void AddBonds(std::vector<Call>& calls)
{
    calls.insert(
        calls.end(),
        {{"OVSBondGet", ReadBond, kZeroOrFailed},
         {"OVSBondCreate, master", [](Name name) { return CreateBond(name, true); }, kZeroOrFailed},
         {"OVSBodChMode", [](Name name) { return OVSBodChMode(kSlb, name); }, kZeroOrFailed},
         {"OVSBondRemove", [](Name name) { return RemoveBond(name, true); }, kZeroOrFailed},
         {"BondManager::Create", [](Name name) { return CreateBond(name, false); }, kZeroOrFailed},
         {"BondManager::Remove", [](Name name) { return RemoveBond(name, false); }, kZeroOrFailed},
         {"OVSBondCreate, first slave", [](Name name) { return CreateBondOf(name, true); },
          kZeroOrFailed},
         {"OVSBondCreate, other slave", [](Name name) { return CreateBondOf(name, false); },
          kZeroOrFailed},
         {"Register, a bond", [](Name name) { return Convert(name, "802.3ad"); }, {0}},
         {"Register, a mode", [](Name name) { return Convert("bond0", name); }, {0}}});
}

} // namespace

const std::vector<Call>& Calls()
{
    static const std::vector<Call> calls = [] {
        std::vector<Call> made;
        AddStores(made);
        AddPorts(made);
        AddInterfaces(made);
        AddBonds(made);
        return made;
    }();
    return calls;
}

} // namespace reliability
