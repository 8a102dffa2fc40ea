/**
 * The VLAN interfaces by which a plain interface's addressing is put into a VLAN. The network
 * program makes them; nobody converts them, and nobody is shown them as VLANs of the host.
 */
#ifndef VORNHOST_SUPPORT_TAGDEVICE_H
#define VORNHOST_SUPPORT_TAGDEVICE_H

#include "netlink.h"

#include <string>

namespace vornhost {

/** @return  the name of the one for a VLAN on the interface of that index: "tag2.10". */
std::string TagDeviceName(int parentIndex, unsigned vlanId);

/**
 * Tells whether an interface is one, by its name and its number. The index in the name is not
 * always its parent's: one that is made together with its bond is named after a slave.
 */
bool IsTagDevice(const Link& link);

/** The same for a VLAN's interface of that name. */
bool IsTagDeviceName(const std::string& name, int vlanId);

} // namespace vornhost

#endif
