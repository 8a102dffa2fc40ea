/**
 * The settings of configuration files when the addressing of one interface is handed to another:
 * what belongs to the addressing, and how changes made meanwhile find their way back.
 */
#ifndef VORNHOST_SUPPORT_SETTINGS_H
#define VORNHOST_SUPPORT_SETTINGS_H

#include "interfacefile.h"
#include "keyvaluefile.h"

#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace vornhost {

/** Addresses, gateways, name servers, MTU and how they are got, of either family. */
bool IsAddressingKey(std::string_view key);

/** What says which interface of which kind a file is for; written anew by each conversion. */
bool IsPlaceKey(std::string_view key);

/** What belongs to a card, its link address and settings, which no other interface takes over. */
bool IsCardKey(std::string_view key);

/**
 * Deletes what gives an interface addresses and gateways. Its MTU and that it does without IPv6 or
 * without routers stay; BOOTPROTO becomes "none".
 */
void RemoveAddressing(KeyValueFile& file);

/** Gives a file another's addressing for its own; an MTU that the other has none of stays. */
void ReplaceAddressing(const KeyValueFile& from, KeyValueFile& to);

/** @return  the addresses that a file asks for, whatever kind of interface it is for. */
std::vector<WantedAddress> ConfiguredAddresses(KeyValueFile file);

/** Whether two files set the same keys to the same values, place keys aside. */
bool SameSettings(const KeyValueFile& one, const KeyValueFile& other);

/** Whether a key's changes are to be carried. */
using KeyFilter = std::function<bool(const std::string& key)>;

/**
 * Carries changes made to a file meanwhile into another: keys whose value is not the one of the
 * base, or that are gone. Place keys and keys that the filter refuses are left alone.
 * @return  whether anything was carried.
 */
bool CarryChanges(const KeyValueFile& base, const KeyValueFile& changed, const KeyFilter& filter,
                  KeyValueFile& target);

} // namespace vornhost

#endif
