#include "bondrecord.h"
#include "checks.h"
#include "commands.h"
#include "hoststate.h"
#include "wording.h"

#include <vornovs/vornovs.h>

namespace vornovsctl {

namespace {

using VORN::OVS::IsInterfaceExist;

constexpr std::size_t kModeColumn = 18; // wider than the longest name
constexpr char kAdvice[] = "See the system log for the reason, and run '/etc/rc.network start' to "
                           "bring the network up as its files have it.";

bool IsNobodyRegistered()
{
    const auto clients = ReadClients();
    return clients && clients->empty();
}

Answer NobodyRegistered(const std::string& bond)
{
    return Failed(kDoesNotHold,
                  "no client is registered, so there are no bonds on the switch: 'vornovsctl "
                  "register' first.",
                  BondFields(bond, std::nullopt));
}

Answer NotRead(const std::string& bond)
{
    return Failed(kDoesNotHold,
                  Quoted(bond) +
                      " is no bond that can be read, or another program held the configuration "
                      "lock: see the system log.",
                  BondFields(bond, std::nullopt));
}

// The library refuses these as well, but only after it has copied gateways.
std::string ReasonNotToCreate(const std::string& bond, const std::vector<std::string>& slaves)
{
    if (IsInterfaceExist(bond)) {
        return "there is an interface " + Quoted(bond) +
               " already; 'vornovsctl bond free-name' tells a free name.";
    }
    for (const std::string& slave : slaves) {
        if (!IsInterfaceExist(BridgeOf(slave))) {
            return Quoted(slave) + " is not on the switch: it has no bridge " +
                   Quoted(BridgeOf(slave)) + ".";
        }
    }
    return "";
}

std::string BondText(const Bond& bond)
{
    return ModeText(bond.mode) + " of " + List(bond.slaves);
}

Names MissingBridges(const Bond& bond)
{
    Names missing;
    for (const std::string& slave : bond.slaves) {
        if (!IsInterfaceExist(BridgeOf(slave))) {
            missing.insert(BridgeOf(slave));
        }
    }
    return missing;
}

} // namespace

Answer CreateBond(const Context& context)
{
    const std::string& name = context.arguments.Get("BOND");
    const VORN_LINK_AGGR_MODE mode = ModeOf(context.arguments.Get("MODE"));
    std::vector<std::string> slaves = context.arguments.All("SLAVE");
    if (IsNobodyRegistered()) {
        return NobodyRegistered(name);
    }
    const std::string reason = ReasonNotToCreate(name, slaves);
    if (!reason.empty()) {
        return Failed(kDoesNotHold, reason + " Nothing was changed.",
                      BondFields(name, std::nullopt));
    }

    context.tell("Building " + Quoted(name) + " takes some seconds.\n");
    if (VORN::OVS::OVSBondCreate(mode, name, slaves) < 0) {
        return Failed(kDoesNotHold,
                      Quoted(name) +
                          " was refused, or another program held the configuration lock: see the "
                          "system log.",
                      BondFields(name, std::nullopt));
    }
    const auto bond = ReadBond(name);
    if (!IsInterfaceExist(name) || !bond) {
        return Failed(kOutOfStep, Quoted(name) + " is not there. " + kAdvice,
                      BondFields(name, bond));
    }
    if (bond->mode != mode ||
        Names(bond->slaves.begin(), bond->slaves.end()) != Names(slaves.begin(), slaves.end())) {
        return Failed(kOutOfStep,
                      Quoted(name) + " is not as it was asked for, but " + BondText(*bond) + ". " +
                          kAdvice,
                      BondFields(name, bond));
    }
    return Done(Quoted(name) + " is " + BondText(*bond) + ".\n", BondFields(name, bond));
}

Answer RemoveBond(const Context& context)
{
    const std::string& name = context.arguments.Get("BOND");
    if (IsNobodyRegistered()) {
        return NobodyRegistered(name);
    }
    context.tell("Taking " + Quoted(name) + " apart takes some seconds.\n");
    VORNLINKAGGROPT record{};
    if (VORN::OVS::OVSBondRemove(name, &record) < 0) {
        return NotRead(name);
    }
    const Bond bond = BondOf(record);
    const Json fields = BondFields(name, bond);
    if (IsInterfaceExist(name)) {
        return Failed(kOutOfStep, Quoted(name) + " is still there. " + kAdvice, fields);
    }
    const Names missing = MissingBridges(bond);
    if (!missing.empty()) {
        return Failed(kOutOfStep,
                      Quoted(name) + " is gone, but these bridges are missing: " + List(missing) +
                          ". " + kAdvice,
                      fields);
    }
    return Done(Quoted(name) + " is gone; it was " + BondText(bond) +
                    ". Each of them has a bridge of its own again.\n",
                fields);
}

Answer GetBond(const Context& context)
{
    const std::string& name = context.arguments.Get("BOND");
    if (IsNobodyRegistered()) {
        return NobodyRegistered(name);
    }
    const auto bond = ReadBond(name);
    if (!bond) {
        return NotRead(name);
    }
    return Done("Bond:    " + bond->name + "\nMode:    " + ModeText(bond->mode) +
                    "\nSlaves:  " + (bond->slaves.empty() ? "none" : List(bond->slaves)) + '\n',
                BondFields(name, bond));
}

Answer ChangeBondMode(const Context& context)
{
    const std::string& name = context.arguments.Get("BOND");
    const VORN_LINK_AGGR_MODE mode = ModeOf(context.arguments.Get("MODE"));
    if (IsNobodyRegistered()) {
        return NobodyRegistered(name);
    }
    // Otherwise a file would be made for whatever name it is.
    const auto before = ReadBond(name);
    if (!before) {
        return NotRead(name);
    }
    if (!VORN::OVS::CheckModeSupport(before->mode)) {
        return Failed(kDoesNotHold,
                      Quoted(name) + " is no bond of the switch, but " + BondText(*before) +
                          "; nothing was changed.",
                      BondFields(name, before));
    }

    if (VORN::OVS::OVSBodChMode(mode, name) < 0) {
        return Failed(kDoesNotHold,
                      "the mode of " + Quoted(name) +
                          " could not be changed, or another program held the configuration lock: "
                          "see the system log.",
                      BondFields(name, ReadBond(name)));
    }
    const auto after = ReadBond(name);
    if (!after || after->mode != mode) {
        return Failed(kOutOfStep,
                      "the mode is in the file of " + Quoted(name) +
                          ", but the switch did not follow. " + kAdvice,
                      BondFields(name, after));
    }
    return Done(Quoted(name) + " is " + BondText(*after) + ".\n", BondFields(name, after));
}

Answer FreeBondName(const Context& /*context*/)
{
    std::string name;
    const int result = VORN::OVS::GetUniqueBondName(name);
    Json fields;
    fields["name"] = name.empty() ? Json(nullptr) : Json(name);
    if (result < 0 || name.empty()) { // success without a name: all are in use
        return Failed(kDoesNotHold, "ovs_bond0 to ovs_bond9 are all in use.", fields);
    }
    return Done(name + '\n', fields);
}

Answer ListBondModes(const Context& /*context*/)
{
    std::string text;
    Json fields;
    fields["modes"] = Json::array();
    for (const bool ofTheSwitch : {false, true}) {
        for (const VORN_LINK_AGGR_MODE mode : Modes(ofTheSwitch)) {
            const std::string name = ModeText(mode);
            const std::string other = ModeText(VORN::OVS::BondManager::DefaultModeConvert(mode));
            text.append(ofTheSwitch ? "switch  " : "Linux   ")
                .append(name)
                .append(name.size() < kModeColumn ? kModeColumn - name.size() : 1, ' ')
                .append("becomes ")
                .append(other)
                .append("\n");
            fields["modes"].push_back({{"name", name},
                                       {"number", static_cast<int>(mode)},
                                       {"on", ofTheSwitch ? "switch" : "linux"},
                                       {"becomes", other}});
        }
    }
    return Done(text, fields);
}

} // namespace vornovsctl
