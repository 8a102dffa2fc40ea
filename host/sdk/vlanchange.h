/**
 * Taking a VLAN interface for the tag of its parent's switch port, and giving it back.
 */
#ifndef VORNHOST_SDK_VLANCHANGE_H
#define VORNHOST_SDK_VLANCHANGE_H

#include "support/keyvaluefile.h"
#include "support/livesettings.h"

#include <string>

namespace vornhost {

/**
 * Moves a VLAN's addressing to its parent, together with the tag, and has its interface taken away.
 * What was there is remembered. Doing it again finishes what was cut short.
 * @return  0 done; -1 it stays as it was, and the system log says why.
 */
int TakeVlan(const LiveNetwork& network, const std::string& name);

/**
 * Has a VLAN interface made that gets its parent's addressing: the remembered one, with what was
 * changed meanwhile, or a new one.
 * @param live  the parent's addressing, for want of a file that says it.
 * @return  0 done; -1 failed, and the system log says why.
 */
int GiveVlan(const std::string& parent, int id, const KeyValueFile& live);

} // namespace vornhost

#endif
