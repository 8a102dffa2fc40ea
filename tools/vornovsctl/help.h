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
    "  4  the clients and the network do not fit together; the message says what to do\n"
    "  5  nothing to do: the name was registered already, perhaps by another program, or was not\n"
    "\n"
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

constexpr char kAboutReset[] = "Forget every client and both interface lists, nothing else";

constexpr char kResetMore[] =
    "For a factory reset that replaces the interfaces' files as well. Nothing is converted back:\n"
    "what is on the switch stays there until the network is started with other files. To bring a\n"
    "host back, unregister its clients instead.\n"
    "\n"
    "Example:\n"
    "  vornovsctl reset --yes";

} // namespace vornovsctl

#endif
