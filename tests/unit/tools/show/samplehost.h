/**
 * A host with one of everything that is drawn.
 */
#ifndef VORNOVS_TESTS_UNIT_TOOLS_SHOW_SAMPLEHOST_H
#define VORNOVS_TESTS_UNIT_TOOLS_SHOW_SAMPLEHOST_H

#include "show/hostmodel.h"

namespace unit {

/** A device that is up, with its link address ending in that number. */
vornovsctl::Device MakeDevice(const std::string& name, int number);

/** On the switch: two bonds, a bridge with ports of clients, one of another program. */
vornovsctl::HostModel SampleHost();

/** A plain host: a Linux bond with a VLAN on it, and a Linux bridge. */
vornovsctl::HostModel PlainHost();

} // namespace unit

#endif
