/**
 * The SDK platform library, libvornsdk: network interfaces, Linux bridges, VLANs, switch bridges.
 */
#ifndef VORNPLATFORM_SDK_H
#define VORNPLATFORM_SDK_H

#include <vornplatform/records.h>

extern "C" {

/**
 * Lists the host's network interfaces.
 * @param selector  2: those that can be converted.
 * @return number of entries filled, at most the capacity; negative: failed.
 */
int VLIBNetGetInterfaceInfo(VLIBNETIFINFO* entries, int capacity, int selector);

/** @return non-zero: the interface is a Linux bridge. */
int VLIBNetBridgeIfIsMaster(const char* name);

/** @return 1 a VLAN interface, the record is filled; anything else: it is none. */
int VLIBNetVlanGet(const char* name, _tag_VLIB_VLAN* vlan);

/** Makes a VLAN interface on the parent with that IP configuration. @return negative: failed. */
int VLIBNetVlanCreate(const char* parent, int vlanId, const VORNNETIPCONFIG* ipConfig);

/** Deletes a VLAN interface. @return negative: failed. */
int VLIBNetVlanRemove(const char* name);

/**
 * Classifies a switch bridge.
 * @return 1 it carries one plain interface, 2 a bond, negative: not of the switch, others: neither.
 */
int VLIBNetOVSIfIsMaster(const char* name);
}

#endif
