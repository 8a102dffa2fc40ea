/**
 * What vornovsctl tells about itself.
 */
#ifndef VORNOVSCTL_HELP_H
#define VORNOVSCTL_HELP_H

namespace vornovsctl {

constexpr char kAbout[] =
    "Puts this host's wired network interfaces under Open vSwitch and takes them back.\n"
    "\n"
    "Clients register under names of their own. While one is registered, every interface X is\n"
    "the port of a switch bridge ovs_X that has X's addresses, gateway and MAC. When the last\n"
    "one has gone, plain Linux networking is back.";

constexpr char kExitStatus[] =
    "Exit status:\n"
    "  0  done\n"
    "  1  not done; the message says what holds instead\n"
    "  2  the command line is wrong; nothing was done\n"
    "  3  not run by root; nothing was done\n"
    "  4  half done, or the clients and the network do not fit together; the message says what\n"
    "     to do\n"
    "  5  nothing to do: it was so before, perhaps by another program's doing\n"
    "\n"
    "With --json, a command prints one object; its \"error\" is null or says what is wrong.\n"
    "The system log tells the reasons. 'vornovsctl COMMAND --help' tells more of a command.";

constexpr char kAboutRegister[] = "Register a client; the first one converts the host";

constexpr char kRegisterMore[] =
    "What happens to the network: for the first client, every wired interface that has a\n"
    "configuration file goes on to the switch with its addresses. That takes about five\n"
    "seconds, in which traffic stops for some milliseconds; connections stay. An interface\n"
    "without a file stays as it is, which the system log tells. For every further client nothing\n"
    "changes. The command goes on when the terminal is closed or interrupted.\n"
    "\n"
    "A bond's mode on the switch is ovs-active-backup, ovs-balance-slb or ovs-balance-tcp. It\n"
    "only counts for the first client, and not where the platform carries bonds as they are.\n"
    "\n"
    "Examples:\n"
    "  vornovsctl register vmhost\n"
    "  vornovsctl register vmhost --bond-mode bond0=ovs-balance-tcp";

constexpr char kAboutUnregister[] = "Withdraw a client; the last one converts the host back";

constexpr char kUnregisterMore[] =
    "What happens to the network: when the last client goes, every bridge's addresses return to\n"
    "its interface, again within seconds and with some milliseconds without traffic. Ports that\n"
    "clients have attached to the bridges go with the bridges. While another client is\n"
    "registered nothing changes.\n"
    "\n"
    "A Linux bond's mode is balance-rr, 802.3ad, balance-xor, active-backup or balance-alb.\n"
    "\n"
    "If interfaces are left on the switch (exit status 4):\n"
    "  /etc/rc.network start         brings the network up as the files have it\n"
    "  vornovsctl register NAME      and then\n"
    "  vornovsctl unregister NAME    convert the host back once more\n"
    "\n"
    "Example:\n"
    "  vornovsctl unregister vmhost";

constexpr char kAboutStatus[] = "Tell who is registered and what is on the switch";

constexpr char kStatusMore[] =
    "Starts nothing and changes nothing. While the switch does not run, what is on it is not\n"
    "known: in JSON \"interfaces\" is then null. \"consistent\" is false where the exit status is "
    "4:\n"
    "a client is registered and nothing is on the switch, or the other way round.\n"
    "\n"
    "Examples:\n"
    "  vornovsctl status\n"
    "  vornovsctl status --json | jq -r '.clients[]'";

constexpr char kAboutAdopt[] = "Take interfaces over from the host's network manager";

constexpr char kAdoptMore[] =
    "Reads what ifupdown, systemd-networkd, NetworkManager or netplan do for the interfaces and\n"
    "what is live, writes their files in /etc/sysconfig/network-scripts, and has the manager let\n"
    "go of them, now and at every boot. Addresses, routes, leases and name servers stay as they\n"
    "are while that happens. A bond comes with its members, and an interface with its VLANs.\n"
    "\n"
    "Without names it takes every wired interface that somebody manages. Wireless interfaces,\n"
    "and others when some are named, stay with their manager. What cannot be carried over, such\n"
    "as a bridge, is told with the reason, and then nothing at all is changed.\n"
    "\n"
    "When something is missing afterwards, all of it is undone. One that was cut short is\n"
    "finished by another 'adopt' and undone by 'release'.\n"
    "\n"
    "Examples:\n"
    "  vornovsctl adopt --dry-run\n"
    "  vornovsctl adopt eth0 eth1";

constexpr char kAboutRelease[] = "Give adopted interfaces back to the manager they had";

constexpr char kReleaseMore[] =
    "Makes the manager's files, and what is started at boot, what they were, and has the manager\n"
    "go on with the interfaces. What was edited in its files since stays. Our own files of the\n"
    "interfaces go, with what was edited in them.\n"
    "\n"
    "While clients are registered nothing is given back: unregister them first.\n"
    "\n"
    "Example:\n"
    "  vornovsctl release";

constexpr char kAboutReset[] = "Forget every client and both interface lists, nothing else";

constexpr char kResetMore[] =
    "For a factory reset that replaces the interfaces' files as well. Nothing is converted back:\n"
    "what is on the switch stays there until the network is started with other files. To bring a\n"
    "host back, unregister its clients instead.\n"
    "\n"
    "Example:\n"
    "  vornovsctl reset --yes";

constexpr char kAboutShow[] = "Draw the host's network";

constexpr char kShowMore[] =
    "Bridges, ports, bonds, VLAN tags, addresses, default routes, links and clients, as a tree, "
    "as\n"
    "a graph for Graphviz or as JSON. Starts nothing and changes nothing, and works while the\n"
    "switch does not run. What cannot be read, as for another user than root, is told; the exit\n"
    "status is then 1.\n"
    "\n"
    "Examples:\n"
    "  vornovsctl show\n"
    "  vornovsctl show --format dot | dot -Tsvg > host.svg";

constexpr char kAboutCheck[] = "Look for what does not fit together";

constexpr char kCheckMore[] =
    "Compares the clients' list, the interfaces' files, the switch and the kernel, as after a\n"
    "power cut or a client that was killed. Starts nothing and changes nothing. The exit status\n"
    "tells the class of the costliest finding, see vornovsctl(8). While a client changes the\n"
    "network, its middle is seen.\n"
    "\n"
    "Example:\n"
    "  vornovsctl check";

constexpr char kAboutRepair[] = "Mend what check finds";

constexpr char kRepairMore[] =
    "Makes the live network what the files say and, where a conversion was cut short, takes the\n"
    "whole host through one: to the switch when clients are registered, off it otherwise. Clients\n"
    "that were registered are registered in the end. Says first what it does, and can be "
    "repeated.\n"
    "\n"
    "Examples:\n"
    "  vornovsctl repair --dry-run\n"
    "  vornovsctl repair";

constexpr char kAboutInterfaceList[] = "List the switch's bridges";

constexpr char kInterfaceListMore[] =
    "One bridge a line, those of other programs too. Starts the switch's services when a client "
    "is\n"
    "registered and they do not run; 'vornovsctl show' starts nothing.\n"
    "\n"
    "Example:\n"
    "  vornovsctl interface list";

constexpr char kAboutInterfaceAdd[] = "Put an interface that was taken off back on the switch";

constexpr char kInterfaceAddMore[] =
    "The interface must have been taken off with 'interface remove'. Its addresses move to its\n"
    "bridge.\n"
    "\n"
    "Example:\n"
    "  vornovsctl interface add eth1";

constexpr char kAboutInterfaceRemove[] = "Take one interface, or a bond, off the switch";

constexpr char kInterfaceRemoveMore[] =
    "The addresses move back to the interface, and the clients stay registered. A bond is taken\n"
    "apart, and its interfaces are plain ones then. Ports of the bridge go with it.\n"
    "\n"
    "Examples:\n"
    "  vornovsctl interface remove eth1\n"
    "  vornovsctl interface remove ovs_bond0";

constexpr char kAboutPortAttach[] = "Make an interface a port of a bridge";

constexpr char kPortAttachMore[] = "Example:\n"
                                   "  vornovsctl port attach ovs_eth0 tap0";

constexpr char kAboutPortDetach[] = "Take a port off a bridge";

constexpr char kPortDetachMore[] =
    "The port through which a bridge reaches the wire is not taken: that is 'interface remove'.\n"
    "\n"
    "Example:\n"
    "  vornovsctl port detach ovs_eth0 tap0";

constexpr char kAboutBondCreate[] = "Make a bond of interfaces on the switch";

constexpr char kBondCreateMore[] =
    "Needs two to 32 interfaces that have bridges of their own; the bond has the addresses of the\n"
    "first one. Takes some seconds.\n"
    "\n"
    "Example:\n"
    "  vornovsctl bond create ovs_bond0 ovs-active-backup eth0 eth1";

constexpr char kAboutBondRemove[] = "Take a bond on the switch apart";

constexpr char kBondRemoveMore[] = "Its addresses go to the bridge of its first interface; each "
                                   "interface has a bridge of its own\n"
                                   "again. Takes some seconds.\n"
                                   "\n"
                                   "Example:\n"
                                   "  vornovsctl bond remove ovs_bond0";

constexpr char kAboutBondGet[] = "Tell a bond's mode and interfaces";

constexpr char kBondGetMore[] = "Example:\n"
                                "  vornovsctl bond get ovs_bond0";

constexpr char kAboutBondMode[] = "Change the mode of a bond on the switch";

constexpr char kBondModeMore[] = "Example:\n"
                                 "  vornovsctl bond mode ovs_bond0 ovs-balance-tcp";

constexpr char kAboutBondFreeName[] = "Tell the first free name for a bond";

constexpr char kBondFreeNameMore[] =
    "The first of ovs_bond0 to ovs_bond9 that no interface has.\n"
    "\n"
    "Examples:\n"
    "  vornovsctl bond free-name\n"
    "  vornovsctl bond create \"$(vornovsctl bond free-name)\" ovs-balance-slb eth0 eth1";

constexpr char kAboutBondModes[] = "List the modes of bonds";

constexpr char kBondModesMore[] =
    "Those of Linux and of the switch, and what each becomes on the other side.\n"
    "\n"
    "Example:\n"
    "  vornovsctl bond modes";

constexpr char kAboutVlanGet[] = "Tell a port's VLAN tag";

constexpr char kVlanGetMore[] = "Example:\n"
                                "  vornovsctl vlan get ovs_eth0";

constexpr char kAboutVlanSet[] = "Set the tag of the live port, without recording it";

constexpr char kVlanSetMore[] = "Lasts until the network is started again.\n"
                                "\n"
                                "Example:\n"
                                "  vornovsctl vlan set tap0 10";

constexpr char kAboutVlanClear[] = "Clear the tag of the live port, without recording it";

constexpr char kVlanClearMore[] =
    "A tag in the port's configuration file comes back when the network is started again.\n"
    "\n"
    "Example:\n"
    "  vornovsctl vlan clear tap0";

constexpr char kAboutVlanCreate[] = "Set a port's tag and record it in its configuration file";

constexpr char kVlanCreateMore[] = "Example:\n"
                                   "  vornovsctl vlan create ovs_eth0 10";

constexpr char kAboutVlanRemove[] = "Clear a port's tag and forget it";

constexpr char kVlanRemoveMore[] = "Example:\n"
                                   "  vornovsctl vlan remove ovs_eth0";

constexpr char kAboutSwitchStart[] = "Start the switch's services";

constexpr char kSwitchStartMore[] = "Example:\n"
                                    "  vornovsctl switch start";

constexpr char kAboutSwitchStop[] = "Stop the switch's services";

constexpr char kSwitchStopMore[] =
    "Not while a client is registered, unless --yes is said: what is on the switch would lose the\n"
    "network sooner or later.\n"
    "\n"
    "Example:\n"
    "  vornovsctl switch stop";

constexpr char kAboutNetworkStart[] = "Make the live network what the files say";

constexpr char kNetworkStartMore[] = "Example:\n"
                                     "  vornovsctl network start ovs_eth0 eth0";

constexpr char kAboutNetworkStop[] = "Hold the network until it is started again";

constexpr char kNetworkStopMore[] =
    "For clients that edit configuration files: what runs keeps running until 'network start', or\n"
    "until the time for that is over. To really stop it, use '/etc/rc.network stop'.\n"
    "\n"
    "Example:\n"
    "  vornovsctl network stop eth0";

constexpr char kAboutGatewayCopy[] = "Copy the records of one interface to another";

constexpr char kGatewayCopyMore[] =
    "IPv4 and IPv6. The live routes follow when the network is started.\n"
    "\n"
    "Example:\n"
    "  vornovsctl gateway copy eth0 ovs_eth0";

constexpr char kAboutGatewayRemove[] = "Remove the records of an interface";

constexpr char kGatewayRemoveMore[] =
    "IPv4 and IPv6. The live routes follow when the network is started.\n"
    "\n"
    "Example:\n"
    "  vornovsctl gateway remove eth0";

} // namespace vornovsctl

#endif
