/**
 * The lines of an "ip -batch" that make, change and remove what the kernel holds.
 */
#ifndef VORNHOST_RCNETWORK_IPCOMMAND_H
#define VORNHOST_RCNETWORK_IPCOMMAND_H

#include "support/netlink.h"

#include <functional>
#include <string>

namespace vornhost {

/** Gives the name of the interface that shall stand for the one of that index. */
using NameOfIndex = std::function<std::string(int)>;

/** @return  "192.0.2.1/24", which names an address in records and files. */
std::string AddressText(const Address& address);

/**
 * The arguments that make an address on an interface as it was on its former one.
 * @param settled  It was checked for duplicates before, so the check is left out.
 */
std::string AddressArguments(const Address& address, const std::string& interface,
                             const std::string& formerInterface, bool settled);

/** What distinguishes routes of which only one is in use: family, table, destination, priority. */
std::string RouteSlot(const Route& route);

/** The slot and the gateway: what names a route in records, whatever its interface. */
std::string RouteKeyText(const Route& route);

/** The arguments that make a route, with its interfaces named by the function. */
std::string RouteArguments(const Route& route, const NameOfIndex& nameOf);

} // namespace vornhost

#endif
