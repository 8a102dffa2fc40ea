/**
 * What the configuration files of a VLAN interface and its parent say while the VLAN is the tag of
 * a switch port, and when it is an interface again. Functions of what the files say now; nothing
 * is read or written here.
 */
#ifndef VORNHOST_SDK_VLANFILES_H
#define VORNHOST_SDK_VLANFILES_H

#include "support/keyvaluefile.h"
#include "support/remembered.h"

#include <optional>
#include <string>

namespace vornhost {

/** A VLAN as it is to be taken from its interface or given one. */
struct VlanPlan {
    std::string name;
    std::string parent;
    int id = 0;
    KeyValueFile live; ///< Addressing of what carries it now, for want of a file that says it.
    std::string mtu;   ///< The VLAN's, when it is not its parent's.
};

/** The parent's file gets the VLAN's addressing and its id; the VLAN's file goes. */
FileStates MovedToParent(const VlanPlan& plan, const FileStates& before);

/** The files of a VLAN interface that is made. */
struct BuiltVlan {
    FileStates build; ///< While the network program makes it.
    FileStates final; ///< To be left behind; differs where there were no files.
};

/**
 * Gives a VLAN an interface. What is remembered comes back as it was, with the changes that were
 * made meanwhile; without memory the parent's addressing becomes the VLAN's.
 */
BuiltVlan MovedToVlan(const VlanPlan& plan, const FileStates& current,
                      const std::optional<RememberedVlan>& memory);

/** Whether the parent's file is what a step that was cut short left of those remembered. */
bool IsHalfMoved(const RememberedVlan& memory, const FileStates& current);

} // namespace vornhost

#endif
