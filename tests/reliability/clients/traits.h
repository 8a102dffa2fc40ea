/**
 * The habits of clients.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_CLIENTS_TRAITS_H
#define VORNOVS_TESTS_RELIABILITY_CLIENTS_TRAITS_H

#include "host/client.h"

namespace reliability {

/** What a client does with the end of its children. */
std::vector<Trait> ChildTraits();

/** What it does with all other signals. */
std::vector<Trait> SignalTraits();

/** What it does with its descriptors. The last has none left. */
std::vector<Trait> DescriptorTraits();

/** What stands in its environment, and what it may use of the machine. */
std::vector<Trait> EnvironmentTraits();

/** Puts there what the hostile environment names. */
void Plant();

/** @return  whether anything that was planted was run or loaded. */
bool PlantedRan();

/**
 * Opens descriptors until that many are left; the limit is low, so that it is quickly reached.
 * @return  the descriptors.
 */
std::vector<int> LeaveDescriptors(int count);

} // namespace reliability

#endif
