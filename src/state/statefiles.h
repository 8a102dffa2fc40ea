#ifndef VORNOVS_STATE_STATEFILES_H
#define VORNOVS_STATE_STATEFILES_H

namespace VORN::OVS {

/** The registered clients. */
constexpr char kRegistrationPath[] = "/usr/vorn/etc/vornovs/ovs_reg.conf";
/** The interfaces that the library has converted. */
constexpr char kInterfaceListPath[] = "/usr/vorn/etc/vornovs/ovs_interface.conf";
/** The interfaces that a client took off the switch one by one. */
constexpr char kIgnoreListPath[] = "/usr/vorn/etc/vornovs/ovs_ignore.conf";

} // namespace VORN::OVS

#endif
