#include "commandtable.h"

#include "checks.h"
#include "help.h"

namespace vornovsctl {

namespace {

constexpr std::size_t kMostNames = 124; // what the network script can be handed at once

const Operand kClient{"NAME", "The client's name", "the client's name", ClientFault};
const Operand kInterface{"INTERFACE", "The interface, such as eth0, or its bridge",
                         "the interface's name", InterfaceFault};
const Operand kAddedInterface{"INTERFACE", "The interface, such as eth0", "the interface's name",
                              PlainInterfaceFault};
const Operand kInterfaces{
    "INTERFACE", "Interfaces; none: every one", "the interface's name", InterfaceFault, 0,
    kMostNames};
const Operand kTakenInterfaces{
    "INTERFACE", "Interfaces; none: every one", "the interface's name", PlainInterfaceFault, 0,
    kMostNames};
const Operand kBridge{"BRIDGE", "The bridge, such as ovs_eth0", "the bridge's name",
                      InterfaceFault};
const Operand kPort{"PORT", "The port, such as tap0", "the port's name", InterfaceFault};
const Operand kTaggedPort{"PORT", "The port, such as ovs_eth0 or tap0", "the port's name",
                          InterfaceFault};
const Operand kBond{"BOND", "The bond, such as ovs_bond0", "the bond's name", InterfaceFault};
const Operand kMode{"MODE", "The mode, see 'bond modes'", "the mode", SwitchModeFault};
// How many they are is judged when all are known.
const Operand kSlaves{
    "SLAVE", "The interfaces, such as eth0 eth1", "the interface's name", PlainInterfaceFault, 1,
    1000};
const Operand kId{"ID", "The VLAN's number, 1 to 4094", "the VLAN id", VlanFault};
const Operand kFrom{"FROM", "The interface that has them", "the interface's name", InterfaceFault};
const Operand kTo{"TO", "The interface that is to have them", "the interface's name",
                  InterfaceFault};

constexpr bool kChanges = true;
constexpr bool kReads = false;
constexpr bool kForAnyone = true;
constexpr bool kForRoot = false;

const std::vector<GroupRow> kGroups{
    {"interface", "List, take off and put back single interfaces"},
    {"port", "Plug ports into bridges and pull them"},
    {"bond", "Bonds on the switch"},
    {"vlan", "VLAN tags of switch ports"},
    {"switch", "Start and stop the switch's services"},
    {"network", "Start and stop the network, as clients of the library can"},
    {"gateway", "Recorded default gateways"},
};

using enum Option;

const std::vector<CommandRow> kCommands{
    {"",
     "register",
     kAboutRegister,
     kRegisterMore,
     {kClient},
     kSwitchModes,
     kChanges,
     kForRoot,
     Register},
    {"",
     "unregister",
     kAboutUnregister,
     kUnregisterMore,
     {kClient},
     kLinuxModes,
     kChanges,
     kForRoot,
     Unregister},
    {"", "status", kAboutStatus, kStatusMore, {}, kNone, kReads, kForRoot, Status},
    {"", "show", kAboutShow, kShowMore, {}, kFormat, kReads, kForAnyone, Show},
    {"", "check", kAboutCheck, kCheckMore, {}, kNone, kReads, kForRoot, Check},
    {"", "repair", kAboutRepair, kRepairMore, {}, kDryRun, kChanges, kForRoot, Repair},
    {"", "adopt", kAboutAdopt, kAdoptMore, {kTakenInterfaces}, kDryRun, kChanges, kForRoot, Adopt},
    {"",
     "release",
     kAboutRelease,
     kReleaseMore,
     {kTakenInterfaces},
     kDryRun,
     kChanges,
     kForRoot,
     Release},
    {"", "reset", kAboutReset, kResetMore, {}, kYes, kChanges, kForRoot, Reset},

    {"interface",
     "list",
     kAboutInterfaceList,
     kInterfaceListMore,
     {},
     kNone,
     kReads,
     kForRoot,
     ListInterfaces},
    {"interface",
     "add",
     kAboutInterfaceAdd,
     kInterfaceAddMore,
     {kAddedInterface},
     kNone,
     kChanges,
     kForRoot,
     AddInterface},
    {"interface",
     "remove",
     kAboutInterfaceRemove,
     kInterfaceRemoveMore,
     {kInterface},
     kNone,
     kChanges,
     kForRoot,
     RemoveInterface},

    {"port",
     "attach",
     kAboutPortAttach,
     kPortAttachMore,
     {kBridge, kPort},
     kNone,
     kChanges,
     kForRoot,
     AttachPort},
    {"port",
     "detach",
     kAboutPortDetach,
     kPortDetachMore,
     {kBridge, kPort},
     kNone,
     kChanges,
     kForRoot,
     DetachPort},

    {"bond",
     "create",
     kAboutBondCreate,
     kBondCreateMore,
     {kBond, kMode, kSlaves},
     kNone,
     kChanges,
     kForRoot,
     CreateBond},
    {"bond",
     "remove",
     kAboutBondRemove,
     kBondRemoveMore,
     {kBond},
     kNone,
     kChanges,
     kForRoot,
     RemoveBond},
    {"bond", "get", kAboutBondGet, kBondGetMore, {kBond}, kNone, kReads, kForRoot, GetBond},
    {"bond",
     "mode",
     kAboutBondMode,
     kBondModeMore,
     {kBond, kMode},
     kNone,
     kChanges,
     kForRoot,
     ChangeBondMode},
    {"bond",
     "free-name",
     kAboutBondFreeName,
     kBondFreeNameMore,
     {},
     kNone,
     kReads,
     kForAnyone,
     FreeBondName},
    {"bond",
     "modes",
     kAboutBondModes,
     kBondModesMore,
     {},
     kNone,
     kReads,
     kForAnyone,
     ListBondModes},

    {"vlan", "get", kAboutVlanGet, kVlanGetMore, {kTaggedPort}, kNone, kReads, kForRoot, GetVlan},
    {"vlan",
     "set",
     kAboutVlanSet,
     kVlanSetMore,
     {kTaggedPort, kId},
     kNone,
     kChanges,
     kForRoot,
     SetVlan},
    {"vlan",
     "clear",
     kAboutVlanClear,
     kVlanClearMore,
     {kTaggedPort},
     kNone,
     kChanges,
     kForRoot,
     ClearVlan},
    {"vlan",
     "create",
     kAboutVlanCreate,
     kVlanCreateMore,
     {kTaggedPort, kId},
     kNone,
     kChanges,
     kForRoot,
     CreateVlan},
    {"vlan",
     "remove",
     kAboutVlanRemove,
     kVlanRemoveMore,
     {kTaggedPort},
     kNone,
     kChanges,
     kForRoot,
     RemoveVlan},

    {"switch",
     "start",
     kAboutSwitchStart,
     kSwitchStartMore,
     {},
     kNone,
     kChanges,
     kForRoot,
     StartSwitch},
    {"switch",
     "stop",
     kAboutSwitchStop,
     kSwitchStopMore,
     {},
     kConfirm,
     kChanges,
     kForRoot,
     StopSwitch},
    {"network",
     "start",
     kAboutNetworkStart,
     kNetworkStartMore,
     {kInterfaces},
     kNone,
     kChanges,
     kForRoot,
     StartNetwork},
    {"network",
     "stop",
     kAboutNetworkStop,
     kNetworkStopMore,
     {kInterfaces},
     kNone,
     kChanges,
     kForRoot,
     StopNetwork},
    {"gateway",
     "copy",
     kAboutGatewayCopy,
     kGatewayCopyMore,
     {kFrom, kTo},
     kNone,
     kChanges,
     kForRoot,
     CopyGateway},
    {"gateway",
     "remove",
     kAboutGatewayRemove,
     kGatewayRemoveMore,
     {kInterface},
     kNone,
     kChanges,
     kForRoot,
     RemoveGateway},
};

} // namespace

const std::vector<GroupRow>& Groups()
{
    return kGroups;
}

const std::vector<CommandRow>& Commands()
{
    return kCommands;
}

} // namespace vornovsctl
