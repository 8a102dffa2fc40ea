/**
 * Calls that are run with their first allocation failing, then their second and so on.
 */
#ifndef VORNOVS_TESTS_UNIT_WITHOUTMEMORY_H
#define VORNOVS_TESTS_UNIT_WITHOUTMEMORY_H

#include <vornovs/vornovs.h>

#include "support/bondcalls.h"

#include <functional>
#include <ostream>
#include <tuple>

namespace unit {

// Longer than a string holds without an allocation.
inline const std::string kClient = "a client with a long name";
inline const std::string kOther = "another client's long name";
inline const std::string kBond = "ovs_bond-with-a-long-name";

struct Entry {
    std::string name;
    /** Answers the call's result; what it needs beforehand it makes in `prepare`. */
    std::function<int()> run;
    int success;
    std::vector<int> failures;
    /** The host is in bridge topology. */
    bool topology = false;
    /** A failure may leave the network stopped: that is what the call documents. */
    bool mayStayStopped = false;

    friend void PrintTo(const Entry& entry, std::ostream* out) { *out << entry.name; }
};

class WithoutMemory : public testing::TestWithParam<std::tuple<Entry, bool>> {
protected:
    static const Entry& Tested() { return std::get<0>(GetParam()); }
};

/** Runs something on an object made before memory runs out, or not at all. */
template <typename Object>
std::function<int()> On(int (*run)(Object&))
{
    return [run] {
        Object object;
        return run(object);
    };
}

inline int AsInt(bool result)
{
    return result ? 1 : 0;
}

inline const BondModes kModes{{"bond0", "802.3ad"},
                              {"a bond with a long name", "a long mode name"}};
inline const std::string kInterface = "../../class/net/lo";
inline const std::string kLongName = "an-interface-with-a-long-name";

inline std::string NameOfRow(const testing::TestParamInfo<std::tuple<Entry, bool>>& row)
{
    return std::get<0>(row.param).name + (std::get<1>(row.param) ? "FromThenOn" : "Once");
}

} // namespace unit

#endif
