#include "bondrecord.h"

#include "checks.h"

#include <vornovs/vornovs.h>

#include <algorithm>
#include <cstring>

namespace vornovsctl {

namespace {

std::string NameIn(const char (&field)[VORN_NAME_SIZE])
{
    return {field, strnlen(field, VORN_NAME_SIZE)};
}

} // namespace

Bond BondOf(const VORNLINKAGGROPT& record)
{
    Bond bond{NameIn(record.szMaster), record.mode, {}};
    const int count = std::clamp(record.nSlave, 0, VORN_LINK_AGGR_SLAVES);
    for (int index = 0; index < count; ++index) {
        bond.slaves.push_back(NameIn(record.rgszSlave[index]));
    }
    return bond;
}

std::optional<Bond> ReadBond(const std::string& name)
{
    VORNLINKAGGROPT record{};
    if (VORN::OVS::OVSBondGet(name, &record) < 0) {
        return std::nullopt;
    }
    return BondOf(record);
}

std::string ModeText(VORN_LINK_AGGR_MODE mode)
{
    const std::string name = NameOf(mode);
    return name.empty() ? "unknown mode " + std::to_string(mode) : name;
}

Json BondFields(const std::string& name, const std::optional<Bond>& bond)
{
    Json fields;
    fields["bond"] = name;
    fields["mode"] = nullptr;
    fields["modeNumber"] = nullptr;
    fields["slaves"] = nullptr;
    if (bond) {
        const std::string mode = NameOf(bond->mode);
        fields["mode"] = mode.empty() ? Json(nullptr) : Json(mode);
        fields["modeNumber"] = static_cast<int>(bond->mode);
        fields["slaves"] = bond->slaves;
    }
    return fields;
}

} // namespace vornovsctl
