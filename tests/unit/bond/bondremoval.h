/**
 * A bond on the switch that is about to go.
 */
#ifndef VORNOVS_TESTS_UNIT_BONDREMOVAL_H
#define VORNOVS_TESTS_UNIT_BONDREMOVAL_H

#include <vornovs/vornovs.h>

#include "support/bondcalls.h"

#include <cstring>

namespace unit {

inline const SwitchBond kBond{"ovs_bond0", 6, {"eth0", "eth1"}};

inline bool Remove(const std::string& name, bool restart = true)
{
    VORNLINKAGGROPT record{};
    return VORN::OVS::BondManager::Remove(name, &record, restart);
}

/** What the platform fills in, its own field left zero. */
inline VORNLINKAGGROPT ReadRecord(const SwitchBond& bond)
{
    VORNLINKAGGROPT record = harness::BondRecord(bond.name, bond.mode, bond.slaves);
    record.reserved = 0;
    return record;
}

inline void ExpectRecord(const VORNLINKAGGROPT& record, const SwitchBond& bond)
{
    const VORNLINKAGGROPT expected = ReadRecord(bond);
    EXPECT_STREQ(record.szMaster, expected.szMaster);
    EXPECT_EQ(record.mode, expected.mode);
    EXPECT_EQ(record.nSlave, expected.nSlave);
    EXPECT_EQ(std::memcmp(&record, &expected, sizeof(record)), 0);
}

class BondRemoval : public testing::Test {
protected:
    BondRemoval() { RecordBond(platform, kBond); }
    harness::RecordingPlatform platform;
};

} // namespace unit

#endif
