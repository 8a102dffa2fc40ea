/**
 * The network SDK platform library, libvornnetsdk: Ethernet links, IP configuration, bonds.
 */
#ifndef VORNPLATFORM_NETSDK_H
#define VORNPLATFORM_NETSDK_H

#include <vornplatform/records.h>

extern "C" {

/** @return 0 the record is filled; anything else: failed. */
int VORNNetGetEthInfo(VORNNETETHINFO* info, const char* name);

/** Reads an interface's IP configuration. @return negative: failed. */
int VORNNetIFGetIPConfig(const char* name, VORNNETIPCONFIG* ipConfig);

/** Reads a bond. @return negative: failed. */
int VORNNetLinkAggrGet(const char* name, VORNLINKAGGROPT* opt);

/** Makes or changes a bond; mode 0 takes it apart. @return negative: failed. */
int VORNNetLinkAggrSet(const VORNLINKAGGROPT* opt);

/** @return the mode of that name. */
VORN_LINK_AGGR_MODE VORNNetLinkAggrStringToMode(const char* text);

/** @return the mode's name, never null. */
const char* VORNNetLinkAggrModeToString(VORN_LINK_AGGR_MODE mode);

/** Appends a slave to the record. @return negative: failed. */
int VORNNetLinkAggrOptSlsaveAdd(VORNLINKAGGROPT* opt, const char* slave);

/**
 * Looks for an interface whose address conflicts with the bond's.
 * @param conflict  receives the interface's name.
 * @param size      size of that buffer in bytes, 32.
 * @param out       an output word of the platform's own.
 * @return 1 a conflict was found and the buffer filled; anything else: none.
 */
int VORNNetBondIPConflict(const char* bond, char* conflict, int size, unsigned int* out);
}

#endif
