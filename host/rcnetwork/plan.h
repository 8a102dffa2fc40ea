/**
 * What has to be done to bring the live network to what the files ask for. A pure function of
 * what was read: nothing here asks or changes the host.
 */
#ifndef VORNHOST_RCNETWORK_PLAN_H
#define VORNHOST_RCNETWORK_PLAN_H

#include "clientoptions.h"
#include "handover.h"
#include "livestate.h"
#include "report.h"
#include "runstate.h"

#include "support/gatewaystore.h"
#include "support/interfacefile.h"
#include "support/remembered.h"
#include "support/switchdatabase.h"

#include <chrono>
#include <map>
#include <set>
#include <string>
#include <vector>

namespace vornhost {

enum class Verb { kStart, kStop };

struct Request {
    Verb verb = Verb::kStart;
    std::set<std::string> names; ///< Plain interfaces; none: everything.
    /** Interfaces that the switch could not be made to carry: they stay reachable without it. */
    std::set<std::string> withoutSwitch;
    bool switchHung = false;                  ///< It was asked before and did not answer.
    std::chrono::seconds servicePatience{60}; ///< How long a service may take to start.
    std::set<std::string> known;              ///< Named ones that were there when the run began.
};

/** What is known of the switch. */
struct SwitchState {
    bool running = false; ///< Both daemons run and the database answered.
    bool hung = false;    ///< Both daemons run and the database did not answer.
    std::vector<SwitchBridge> bridges;

    const SwitchBridge* Find(const std::string& bridge) const;
};

/** A bond of the kernel that the switch stands in for, as it was. */
struct FormerBond {
    RememberedBond bond;
    SwitchValues columns; ///< What its options are called on the switch.
};

/** All that a plan depends on. */
struct Inputs {
    Request request;
    std::map<std::string, InterfaceFile> files; ///< By interface.
    std::vector<GatewayRecord> gateways;
    LiveState live;
    SwitchState switchState;
    RunState runState;
    std::map<std::string, FormerBond> formerBonds; ///< By the bond's plain name.
    Handover handover;
    std::map<std::string, LiveClient> clients; ///< By the interface that they were started for.
};

/** How the lines of a stage are carried out. */
enum class StageKind {
    kServices,  ///< Start scripts; what follows is planned anew once they ran.
    kSwitch,    ///< Commands of one transaction of the switch's database.
    kWait,      ///< "INTERFACE MAC" that must exist before anything goes on.
    kSettings,  ///< "INTERFACE SETTING VALUE"
    kBatch,     ///< Lines of one "ip -batch".
    kAnnounce,  ///< "INTERFACE" whose place the network outside is told.
    kAnnouncer, ///< "INTERFACE" whose place it is told now and for a while.
    kRouters,   ///< "INTERFACE METRIC GATEWAY" of a route that is the kernel's to make again.
    kCards,     ///< "INTERFACE OPTION SETTING...", of ethtool.
    kResolver,  ///< "tell NAME server ADDRESS... domain DOMAIN..." or "forget NAME".
    kClients,   ///< "end NAME", "drop NAME" or "start NAME of NAME,NAME: OPTION; OPTION".
    kReady,     ///< "KIND NAME..." that is waited for as long as that makes sense.
    kGateways   ///< "INTERFACE" whose gateway records are dropped.
};

struct Stage {
    StageKind kind;
    std::string title;
    std::vector<std::string> lines;
};

struct Plan {
    std::vector<Stage> stages; ///< In the order in which they are carried out; none is empty.
    std::vector<Remark> remarks;
    RunState recordBefore; ///< To be on disk before the first change...
    RunState recordAfter;  ///< ...and after the last one.
    bool waitForSwitch = true;
    std::chrono::seconds servicePatience{60};

    bool Empty() const { return stages.empty(); }
    std::string Text() const;
};

Plan MakePlan(const Inputs& inputs);

/** @return  "ovs_eth0" for "eth0". */
std::string BridgeOf(const std::string& plainName);

/** @return  "eth0" for "ovs_eth0" and for "eth0". */
std::string PlainOf(const std::string& name);

} // namespace vornhost

#endif
