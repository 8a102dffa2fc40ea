/**
 * libvornovs: puts the host's wired network interfaces under Open vSwitch and takes them back.
 *
 * Client programs register by name. The first registration makes of every eligible interface X a
 * switch bridge "ovs_X" that takes over X's addresses; the last unregistration brings plain Linux
 * networking back.
 *
 * Rules that hold for every function and class below:
 * - No exception leaves the library. When memory runs out, a call returns its failure result.
 * - Nothing is cached between calls: the files and the running system are the only state.
 * - Failures are reported to the system log as well as through the result.
 * - "The lock" is the configuration lock "/tmp/ovs_config.lock", which serialises all processes
 *   that use the library; a call that takes it waits up to 5 seconds for it.
 * - Threads of one client may call at once: for the lock they wait for each other as processes do.
 *   An object of a class, and a variable that a call fills, is one thread's at a time.
 * - Callers need the privilege to configure the network (root).
 */
#ifndef VORNOVS_VORNOVS_H
#define VORNOVS_VORNOVS_H

#include <vornplatform/hook.h>
#include <vornplatform/records.h>

#include <map>
#include <set>
#include <string>
#include <vector>

#define VORNOVS_API __attribute__((visibility("default")))

namespace VORN {
namespace OVS {

/* Registration. */

/**
 * Asks whether a client is registered.
 * @param name  the client's name.
 * @return  0 registered; -1 not registered, or the registrations cannot be read.
 * Lock:   not taken; the answer is of the moment.
 * Blocks: no.
 */
VORNOVS_API int IsRegister(const std::string& name);

/**
 * Adds every registered name to a set.
 * @param names  keeps what it holds and receives the registered names.
 * @return  size of the set afterwards; 0 when the registrations cannot be read, the set is then as
 *          it was.
 * Lock:   not taken; the answer is of the moment.
 * Blocks: no.
 */
VORNOVS_API int GetAllRegister(std::set<std::string>& names);

/**
 * Asks whether the switch is in use: whether at least one client is registered. No daemon is asked.
 * @return  true when a client is registered; false when none is, or on failure.
 * Lock:   not taken.
 * Blocks: no.
 */
VORNOVS_API bool IsOVSRunning();

/**
 * Gives the reason why this host cannot carry Open vSwitch.
 * @return  0 it can; a positive value would be the reason. This build always returns 0.
 * Lock:   not taken.
 * Blocks: no.
 */
VORNOVS_API int NotSupportOVS();

/**
 * The same reason, never negative. Despite the name, 0 means that Open vSwitch is supported.
 * @return  0 supported; a positive value is the reason why not.
 * Lock:   not taken.
 * Blocks: no.
 */
VORNOVS_API int IsOVSSupport();

/**
 * Registers a client. The first registration converts the whole host to Open vSwitch.
 * @param name       name of the client's choosing, without a line break.
 * @param bondModes  bond interface name to mode name, for the bonds whose mode on the switch the
 *                   client wants to choose; only looked at when a conversion runs. May be empty.
 * @return  0 registered. Also 0, and nothing is registered, when the lock or the registrations
 *            could not be had or the conversion failed: ask IsRegister() to be sure.
 *          1 the name was registered already; nothing changed.
 *         -1 the name could not be recorded, or memory ran out.
 *         >1 the host does not support Open vSwitch; the value is the reason.
 * Lock:   held for the whole call.
 * Blocks: a conversion pauses 3 s after stopping the network and waits up to 8 s for the first
 *         bridge's link; each Linux bond adds 3 s and up to 8 s. Without a conversion: no pause.
 */
VORNOVS_API int Register(const std::string& name,
                         const std::map<std::string, std::string>& bondModes);

/**
 * Withdraws a client. The last one's withdrawal converts the host back to plain Linux networking.
 * @param name       the registered name.
 * @param bondModes  as for Register(): the modes of the Linux bonds to bring back.
 * @return  0 withdrawn, even when the conversion back failed (which is logged).
 *          1 the name was not registered; nothing changed.
 *         -1 the lock or the registrations could not be had, the withdrawal could not be recorded,
 *            or memory ran out.
 * Lock:   held for the whole call.
 * Blocks: a conversion back pauses 3 s after stopping the network; bonds add 3 s and up to 8 s
 *         each, VLANs add 3 s.
 */
VORNOVS_API int UnRegister(const std::string& name,
                           const std::map<std::string, std::string>& bondModes);

/**
 * Factory reset of the library's state: forgets every registration and both interface lists, and
 * fires the change hook with ACTION "delete" when a client was registered. No interface is
 * converted back and no daemon is stopped.
 * Lock:   not taken.
 * Blocks: as long as the hook's programs run.
 */
VORNOVS_API void OVSSetDefault();

/* Interfaces and ports. */

/**
 * Takes one interface, or a bond's slaves, off the switch: its bridge's addressing goes back to the
 * plain interface, which is started on its own and listed in
 * "/usr/vorn/etc/vornovs/ovs_ignore.conf". AddInterface() is the way back.
 * @param bridge  the bridge, such as "ovs_eth0" or "ovs_bond0".
 * @return  0 done, even when the network script failed (which is logged). Also 0 for a bridge that
 *            carries neither an interface nor a bond: it is stopped and nothing else happens.
 *         -1 not a bridge of the switch, and nothing was done; or a later step failed: what was
 *            done by then stays and the interface's network is not started; or memory ran out.
 * Lock:   not taken; a conversion in another process is not waited for.
 * Blocks: until the network script has stopped and started the interfaces. No pause.
 */
VORNOVS_API int RemoveInterface(const std::string& bridge);

/**
 * Puts a plain interface back on the switch and takes it off the list of those left out.
 * @param name  the interface, such as "eth0", that RemoveInterface() took off.
 * @return  0 done, even when the network script failed (which is logged).
 *         -1 the bridge's configuration could not be written, the interface was not on the list, or
 *            memory ran out: the interface's network was stopped by then and is not started.
 * Lock:   not taken; a conversion in another process is not waited for.
 * Blocks: until the network script has stopped and started the interface. No pause.
 */
VORNOVS_API int AddInterface(const std::string& name);

/**
 * Lists the switch's bridges, starting the switch's services when they do not run.
 * @param out  replaced by the bridges' names; as it was when no client is registered or the
 *             registrations cannot be read.
 * @return  0 listed, or no client is registered; -1 the registrations cannot be read, the switch's
 *          services or tool cannot be started, or memory ran out.
 * Lock:   not taken; the answer is of the moment.
 * Blocks: until the services and the switch's tool have answered.
 */
VORNOVS_API int ListInterface(std::set<std::string>& out);

/**
 * Plugs a port into a bridge.
 * @param bridge  the bridge, such as "ovs_eth0".
 * @param port    the port's interface, such as "tap0".
 * @return  1 attached. Also 1, and nothing is attached, when the switch's services do not run and
 *            cannot be started (which is logged).
 *          0 no client is registered; nothing was done.
 *         -1 no lock, the registrations cannot be read, the switch refused, or memory ran out.
 * Lock:   held for the whole call.
 * Blocks: until the switch's tool has ended.
 */
VORNOVS_API int AttachPort(const std::string& bridge, const std::string& port);

/** Unplugs a port from a bridge: 1 detached; the rest is as for AttachPort(). */
VORNOVS_API int DetachPort(const std::string& bridge, const std::string& port);

/* Bonds on the switch. */

/**
 * Builds a bond on the switch from interfaces that are switch bridges already.
 * @param mode    6 active-backup, 7 balance-slb or 8 balance-tcp; others are refused.
 * @param name    name of the new bond, such as "ovs_bond0": at most 15 bytes, not in use.
 *                GetUniqueBondName() finds one.
 * @param slaves  two or more plain interfaces, such as "eth0"; the first one's addressing becomes
 *                the bond's. Only read.
 * @return  0 the parameters were accepted; a later step that failed is only logged.
 *         -1 no lock, no client registered, or a parameter refused (the first slave's gateway
 *            may then have been copied to the bond already); or memory ran out.
 * Lock:   held for the whole call.
 * Blocks: stops the slaves' network, pauses 3 seconds, starts the bond.
 */
VORNOVS_API int OVSBondCreate(VORN_LINK_AGGR_MODE mode, const std::string& name,
                              std::vector<std::string>& slaves);

/**
 * Takes a bond on the switch apart: its addressing goes to the first slave's bridge.
 * @param name  the bond, such as "ovs_bond0".
 * @param out   receives the bond as it was: name, mode and slaves. On failure it holds what had
 *              been read by then.
 * @return  0 removed; a step that failed after the bond's file was read is only logged.
 *         -1 no lock, no client registered, no record, the bond's file cannot be read or lists
 *            fewer than two slaves (no file was touched); or memory ran out.
 * Lock:   held for the whole call.
 * Blocks: stops the network of bond and slaves, pauses 3 seconds, starts the slaves' bridges.
 */
VORNOVS_API int OVSBondRemove(const std::string& name, VORNLINKAGGROPT* out);

/**
 * Reads a bond.
 * @param name  the bond, such as "ovs_bond0".
 * @param out   filled by the platform; not to be null.
 * @return  0 read; -1 no lock, no client registered, or the bond cannot be read.
 * Lock:   held for the whole call.
 * Blocks: no.
 */
VORNOVS_API int OVSBondGet(const std::string& name, VORNLINKAGGROPT* out);

/**
 * Changes a switch bond's mode in its file and on the live switch.
 * @param mode  6 active-backup, 7 balance-slb or 8 balance-tcp; unchecked, see CheckModeSupport().
 * @param name  the bond, such as "ovs_bond0".
 * @return  0 the file was changed, even when the network script failed (which is logged); -1 no
 *          lock, no client registered, the file could not be changed, or memory ran out.
 * Lock:   held for the whole call.
 * Blocks: until the network script has ended.
 */
VORNOVS_API int OVSBodChMode(VORN_LINK_AGGR_MODE mode, const std::string& name);

/**
 * Gives the mode of a name, such as "802.3ad" or "active-backup".
 * @return  the platform's mode; 0 for an unknown or a null name.
 * Lock: not taken. Blocks: no.
 */
VORNOVS_API VORN_LINK_AGGR_MODE StrToMode(const char* text);

/**
 * Gives the name of a mode.
 * @param out  replaced by the name; empty when memory ran out.
 * Lock: not taken. Blocks: no.
 */
VORNOVS_API void ModeToStr(VORN_LINK_AGGR_MODE mode, std::string& out);

/**
 * Asks whether the switch can run a mode.
 * @return  true for 6, 7 and 8; false for every other one.
 * Lock: not taken. Blocks: no.
 */
VORNOVS_API bool CheckModeSupport(VORN_LINK_AGGR_MODE mode);

/**
 * Finds a free name for a new bond: the first of ovs_bond0 to ovs_bond9 that no interface has.
 * @param out  receives the name; as it was when all ten are in use, so compare it.
 * @return  0, also when all ten are in use.
 * Lock:   not taken; the answer is of the moment.
 * Blocks: no.
 */
VORNOVS_API int GetUniqueBondName(std::string& out);

/* VLAN tags of switch ports. */

/**
 * Reads a port's VLAN tag from the switch.
 * @param interface  the port, such as "ovs_eth0".
 * @param out        both names become the port's, cut to 15 bytes; the id is written only when the
 *                   port is tagged. Not to be null.
 * @return  1 tagged, 0 untagged, -1 the switch could not be asked or memory ran out.
 * Lock:   not taken.
 * Blocks: until the switch's tool has ended.
 */
VORNOVS_API int OVSVlanGet(const std::string& interface, _tag_VLIB_VLAN* out);

/**
 * Sets the tag of a live port without recording it; OVSVlanCreate() does both.
 * @param id  the VLAN id in decimal, "1" to "4094"; the switch checks it.
 * @return  0 set; -1 the switch refused or memory ran out.
 * Lock:   not taken.
 * Blocks: until the switch's tool has ended.
 */
VORNOVS_API int OVSVlanSet(const std::string& interface, const std::string& id);

/**
 * Clears the tag of a live port but not a recorded one; OVSVlanRemove() does both.
 * @return  0 cleared; -1 the switch refused.
 * Lock:   not taken.
 * Blocks: until the switch's tool has ended.
 */
VORNOVS_API int OVSVlanClear(const std::string& interface);

/**
 * Records a tag in the port's configuration file and sets it on the live port.
 * @param id  the VLAN id in decimal, "1" to "4094"; the switch checks it.
 * @return  0 done, even when the file or the switch refused (which is logged); -1 the platform's
 *          file lock could not be had, or memory ran out.
 * Lock:   not the configuration lock, but the platform's file lock around the file's edit, for
 *         which it waits up to 5 seconds.
 * Blocks: until the switch's tool has ended.
 */
VORNOVS_API int OVSVlanCreate(const std::string& interface, const std::string& id);

/** Removes the recorded tag and clears the live port's; the rest is as for OVSVlanCreate(). */
VORNOVS_API int OVSVlanRemove(const std::string& interface);

/* Daemons, network and interfaces. */

/**
 * Asks whether both switch services, "vornovs-db" and "vornovs-vswitch", run.
 * Lock: not taken. Blocks: no.
 */
VORNOVS_API bool IsDaemonAlive();

/**
 * Starts the database service, then the switch service.
 * @return  true both started; false one failed, a started database stays started.
 * Lock:   not taken.
 * Blocks: until the services answer.
 */
VORNOVS_API bool StartOVSDaemon();

/**
 * Stops the switch service, then the database service.
 * @return  true both stopped; false one failed.
 * Lock:   not taken.
 * Blocks: until the services have ended.
 */
VORNOVS_API bool StopOVSBaemon();

/**
 * Starts the network of the named interfaces with "/etc/rc.network start".
 * @param names  at most 124 interface names; empty means every interface.
 * @return  true the script succeeded; false it failed, or there are too many names.
 * Lock:   not taken.
 * Blocks: until the script has ended.
 */
VORNOVS_API bool StartNetwork(const std::vector<std::string>& names);

/** Stops the network of the named interfaces; the rest is as for StartNetwork(). */
VORNOVS_API bool StopNetwork(const std::vector<std::string>& names);

/**
 * Asks the kernel whether an interface exists.
 * Lock: not taken. Blocks: no.
 */
VORNOVS_API bool IsInterfaceExist(const std::string& name);

/**
 * Copies the default-gateway records of one interface to another, IPv4 first, then IPv6.
 * @return  0 both copied (nothing to copy is success); -1 a copy failed, IPv6 is not tried after
 *          IPv4 failed, or a name is null.
 * Lock:   not taken.
 * Blocks: until the gateway tool has ended.
 */
VORNOVS_API int CopyGatewayInfo(const char* from, const char* to);

/**
 * Removes the default-gateway records of an interface, IPv4 first, then IPv6.
 * @return  0 both removed; -1 one failed, or the name is null.
 * Lock:   not taken.
 * Blocks: until the gateway tool has ended.
 */
VORNOVS_API int RemoveGateWayInfo(const char* name);

/* Stores. */

/**
 * The registered client names, "/usr/vorn/etc/vornovs/ovs_reg.conf": one name a line, sorted; the
 * file exists only while a name is registered. Takes no lock; not for use by several threads.
 */
class VORNOVS_API OVSRegConf {
public:
    OVSRegConf();
    virtual ~OVSRegConf();

    /**
     * Merges the names of the file into the set.
     * @return  0 read, absent, or the state folder could not be made; -1 cannot be opened.
     */
    int LoadFromConfig();

    /** Adds a name and saves. @return 0 saved, -1 added but not saved, 1 was registered already. */
    int Register(const std::string& name);

    /** Removes a name and saves. @return 0 saved, -1 removed but not saved, 2 not registered. */
    int UnRegister(const std::string& name);

    /** @return 1 registered, -1 not registered. */
    int IsRegister(const std::string& name);

    /** Adds the names to a set. @return the set's size afterwards; -1 memory ran out. */
    int GetRegNames(std::set<std::string>& out);

    /** Makes the state folder. @return 0 it exists, -1 it could not be made. */
    int CheckAndMkdir() const;

    /** Saves the names. @return 0 saved (or no state folder), -1 cannot be opened for writing. */
    int WriteToConfig() const;

private:
    std::set<std::string> m_names;
};

/**
 * A list of interface names in a file of the state folder, one name a line, sorted; the file exists
 * only while it lists a name. Takes no lock; not for use by several threads.
 */
class VORNOVS_API OVSIfsConf {
public:
    /** Loads the list at once; a list that cannot be read counts as empty. */
    explicit OVSIfsConf(std::string path);
    virtual ~OVSIfsConf();

    /**
     * Merges the names of the file into the list.
     * @return  0 read, absent, or the state folder could not be made; -1 cannot be opened.
     */
    int LoadFromConfig();

    /** Adds a name and saves. @return 0 saved; -1 already listed, or not saved. */
    int Write(const std::string& name);

    /** Removes a name and saves. @return 0 saved; -1 not listed, or not saved. */
    int Remove(const std::string& name);

    /** Saves the given names. @return 0 saved (or no state folder), -1 cannot be opened. */
    int WriteToConfig(const std::set<std::string>& names) const;

    /** Makes the state folder. @return 0 it exists, -1 it could not be made. */
    int CheckAndMkdir() const;

private:
    std::string m_path;
    std::set<std::string> m_names;
};

/* Switch. */

/**
 * The hook "net/ovs_change", fired when a conversion begins and when it has completed. Its programs
 * find the action in the environment variable ACTION.
 */
class VORNOVS_API OVSChangeHook : public vornnetsdk::hook::BaseHook {
public:
    /** @param action  "create" (to the switch) or "delete" (back). */
    explicit OVSChangeHook(const std::string& action);
    ~OVSChangeHook() override;
};

/** Bond modes and bonds on the switch. Takes no lock. */
class VORNOVS_API BondManager {
public:
    /** @return the platform's mode of that name, unchecked. */
    static VORN_LINK_AGGR_MODE StrToMode(const std::string& text);

    /** Gives the platform's name of a mode. */
    static void ModeToStr(VORN_LINK_AGGR_MODE mode, std::string& out);

    /** Gives the switch's option string, quotes included; empty for every mode but 6, 7 and 8. */
    static void ModeToBondOPT(VORN_LINK_AGGR_MODE mode, std::string& out);

    /** @return whether the switch can run the mode: 6, 7 and 8. */
    static bool CheckModeSupport(VORN_LINK_AGGR_MODE mode);

    /** @return the mode that stands for this one on the other side; 0 for an unknown mode. */
    static VORN_LINK_AGGR_MODE DefaultModeConvert(VORN_LINK_AGGR_MODE mode);

    /** Reads a bond into the caller's record. @return false: it could not be read. */
    static bool Get(const std::string& name, VORNLINKAGGROPT* out);

    /**
     * Changes the mode of a switch bond in its file and has the network script apply it.
     * @return  true the file was changed, even when the script failed; false it was not.
     * Blocks: until the script has ended.
     */
    static bool BondChMode(VORN_LINK_AGGR_MODE mode, const std::string& name);

    /**
     * Builds a bond from interfaces that are switch bridges already.
     * @param slaves   two or more plain interfaces; only read.
     * @param restart  stop the slaves' network, pause and start the bond around the change.
     * @return  true the parameters were accepted; a later step that failed is only logged. false a
     *          parameter was refused (the first slave's gateway may then have been copied to the
     *          bond already), or memory ran out.
     * Blocks: with `restart` 3 s and as long as the network script runs.
     */
    static bool Create(VORN_LINK_AGGR_MODE mode, const std::string& master,
                       std::vector<std::string>& slaves, bool restart);

    /**
     * Gives a bond's configuration to its first slave's bridge and its slaves their own bridges.
     * @param out      receives the bond as its file has it; null is refused.
     * @param restart  stop bond and slaves, pause and start the slaves' bridges around the change.
     * @return  true removed; a step that failed after the file was read is only logged. false the
     *          file cannot be read or lists fewer than two slaves, or memory ran out.
     * Blocks: with `restart` 3 s and as long as the network script runs.
     */
    static bool Remove(const std::string& name, VORNLINKAGGROPT* out, bool restart);

    /**
     * Gives the first of ovs_bond0 to ovs_bond9 that no interface has.
     * @param out  as it was when all ten are in use.
     * @return  true, always.
     */
    static bool GetUniqueName(std::string& out);
};

/** VLAN tags of switch ports. Takes the platform's file lock, not the configuration lock. */
class VORNOVS_API VlanManager {
public:
    /**
     * Reads a port's tag.
     * @param out  both names become the port's, cut to 15 bytes; the id only when tagged.
     * @return  1 tagged, 0 untagged, -1 the switch could not be asked.
     */
    static int Get(const std::string& port, _tag_VLIB_VLAN* out);

    /** Sets the tag on the live port. @param id decimal text. @return 0, -1 failed. */
    static int Set(const std::string& port, const std::string& id);

    /** Clears the tag of the live port. @return 0, -1 failed. */
    static int Clear(const std::string& port);

    /**
     * Records the tag in the port's configuration file and sets it.
     * @return  0 done, even when the file or the switch refused (logged); -1 no file lock.
     * Lock:   the platform's file lock around the file's edit, waiting up to 5 s.
     */
    static int Create(const std::string& port, const std::string& id);

    /** Removes the recorded tag and clears it; the rest is as for Create(). */
    static int Remove(const std::string& port);
};

/**
 * Discovers the host's interfaces and moves them on to the switch and back. Made for one call and
 * thrown away; not for use by several threads. Takes no lock: Register() and UnRegister() hold it.
 */
class VORNOVS_API OVSManager {
public:
    OVSManager();
    virtual ~OVSManager();

    /**
     * Reads the interfaces that can be converted; VLANs count through their parent.
     * @return  0 success; -1 the platform lists none or failed.
     */
    int GetInterface();

    /**
     * Reads the switch's bridges, starting the switch's services when they do not run.
     * @param bridges  cleared, then receives the names.
     * @return  0 success; -1 the services or the switch's tool cannot be started.
     */
    int GetSwitchList(std::set<std::string>& bridges);

    /** Reads a bond into the model, its mode turned to the other side's. @return 0, always. */
    int InitBondOpt(const std::string& name);

    /** The same with the mode of that name, also when the bond cannot be read. @return 0. */
    int InitBondOpt(const std::string& name, const std::string& mode);

    /**
     * Makes an interface a port of a bridge.
     * @return  true done, or the switch's services cannot be started; false the switch refused.
     */
    bool AttachPort(const std::string& bridge, const std::string& port) const;

    /** Takes a port off a bridge. @return as AttachPort(). */
    bool DetachPort(const std::string& bridge, const std::string& port) const;

    /**
     * Converts the whole host to the switch.
     * @return  true it ran to its end; false the interfaces could not be read, a bond or a VLAN
     *          could not be rebuilt, or memory ran out. What was done by then stays.
     * Blocks: see Register().
     */
    bool CreateAll();

    /** Writes the configuration of "ovs_" + name from the interface's. @return 0, -1 failed. */
    int CreateOVS(const std::string& name) const;

    /** Writes the bridge's file from the interface's file. @return 0, -1 failed. */
    int CreateOVSForGeneral(const char* name, const char* bridge, const char* source,
                            const char* target) const;

    /**
     * Builds the model's bonds on the switch. @return 0, -1 at the first that was refused.
     * Blocks: 3 s a bond.
     */
    int CreateOVSBond();

    /** Sets the model's VLANs as tags on the bridges. @return 0, -1 at the first that failed. */
    int CreateOVSVlan() const;

    /**
     * Takes the model's Linux bonds apart and puts their slaves in their place.
     * @return  0, -1 at the first that failed.
     * Blocks: 3 s and up to 8 s a bond.
     */
    int RemoveLinuxBond();

    /** Removes the model's Linux VLANs. @return 0, -1 at the first that failed. */
    int RemoveLinuxVlan() const;

    /**
     * Converts the whole host back to plain Linux networking.
     * @return  true it ran to its end; false the bridges could not be read, a tag or a bond could
     *          not be removed, a VLAN could not be rebuilt, or memory ran out.
     * Blocks: see UnRegister().
     */
    bool DeleteAll();

    /** Gives the bridge's configuration back to its interface. @return 0, -1 failed. */
    int DestroyOVS(const std::string& bridge) const;

    /**
     * Takes the model's bonds on the switch apart and puts their slaves' bridges in their place.
     * @return  0, -1 at the first that failed.
     * Blocks: 3 s a bond.
     */
    int RemoveOVSBond();

    /** Removes the tags of the model's VLANs. @return 0, -1 at the first that failed. */
    int RemoveOVSVlan() const;

    /**
     * Makes the model's bonds Linux bonds and waits for each.
     * @return  0, -1 at the first that failed.
     * Blocks: up to 8 s a bond.
     */
    int CreateLinuxBond();

    /** Makes the model's VLANs Linux VLANs. @return 0, -1 at the first that failed. */
    int CreateLinuxVlan() const;

private:
    std::set<std::string> m_ifs;
    std::map<std::string, _tag_VLIB_VLAN> m_vlans;
    std::map<std::string, VORNLINKAGGROPT> m_bonds;
};

} // namespace OVS
} // namespace VORN

#endif
