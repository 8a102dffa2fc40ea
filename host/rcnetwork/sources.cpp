#include "sources.h"

#include "support/contains.h"

#include <algorithm>
#include <iterator>

#include <linux/rtnetlink.h>

namespace vornhost {
namespace {

constexpr char kVlanKind[] = "vlan";

/** Stands for the number of an interface that has none yet; hardly any has one as high. */
int NumberFor(const std::string& name)
{
    constexpr unsigned kFirst = 10000;
    constexpr unsigned kCount = 90000;
    unsigned number = 0;
    for (const char letter : name) {
        number = number * 31 + static_cast<unsigned char>(letter);
    }
    return static_cast<int>(kFirst + number % kCount);
}

class SourceFinder {
public:
    SourceFinder(const Inputs& inputs, const Kinship& kinship, Unit& unit)
        : m_inputs(inputs), m_kinship(kinship), m_unit(unit)
    {
    }
    void Run();

private:
    void Absorb();
    void NameCarrier();
    std::string TagDevice() const;
    void Look(const std::string& base);
    void Add(const Link* link, bool stays);
    bool BelongsToAVlan(const Link& device, const std::string& base) const;
    bool HasAddresses(const Link& link) const;
    bool CanJoinAnyTime(const Link& member) const;
    bool CarriesBefore() const;
    bool IsLate() const;
    bool IsOnWrongParent() const;
    bool ChangesMode() const;

    const Inputs& m_inputs;
    const Kinship& m_kinship;
    Unit& m_unit;
};

void SourceFinder::Absorb()
{
    auto& absorbed = m_unit.absorbed;
    for (const std::string& member : m_kinship.MembersOf(m_unit.name)) {
        absorbed.push_back(member);
    }
    for (const std::string& bond : m_kinship.LegaciesOf(m_unit.name)) {
        absorbed.push_back(bond);
    }
    if (m_unit.tag) {
        for (const Link& link : m_inputs.live.links) {
            if (link.kind == kVlanKind && !IsTagDevice(link) && m_unit.port != nullptr &&
                link.parent == m_unit.port->index && link.vlanId == static_cast<int>(*m_unit.tag) &&
                !m_kinship.HasFile(link.name)) {
                absorbed.push_back(link.name);
            }
        }
    }
}

/** One that is there keeps its name; a new one is named after an interface that nobody else is. */
std::string SourceFinder::TagDevice() const
{
    const Link* owner = m_unit.port;
    for (const Link& link : m_inputs.live.links) {
        if (owner != nullptr && IsTagDevice(link) && link.parent == owner->index &&
            link.vlanId == static_cast<int>(*m_unit.tag)) {
            return link.name;
        }
    }
    if (owner == nullptr && !m_unit.members.empty()) {
        owner = m_unit.members.back();
    }
    return TagDeviceName(owner == nullptr ? NumberFor(m_unit.name) : owner->index, *m_unit.tag);
}

void SourceFinder::NameCarrier()
{
    if (m_unit.target == Target::kSwitch) {
        m_unit.carrier = m_unit.bridge;
    } else if (m_unit.tag) {
        m_unit.carrier = TagDevice();
    } else if (m_unit.kind == UnitKind::kSwitchBond) {
        m_unit.carrier = m_unit.port->name;
    } else {
        m_unit.carrier = m_unit.name;
    }
    m_unit.carrierLink = m_unit.target == Target::kSwitch ? m_unit.bridgeLink
                                                          : m_inputs.live.FindLink(m_unit.carrier);
}

bool SourceFinder::HasAddresses(const Link& link) const
{
    const auto& addresses = m_inputs.live.addresses;
    return std::any_of(addresses.begin(), addresses.end(), [&](const Address& address) {
        return address.index == link.index && address.scope == RT_SCOPE_UNIVERSE;
    });
}

void SourceFinder::Add(const Link* link, bool stays)
{
    if (link == nullptr || link->name == m_unit.carrier ||
        m_unit.SourceOf(link->index) != nullptr) {
        return;
    }
    m_unit.sources.push_back({link, stays});
}

/** What a file asks for as the VLAN's own interface takes over what the tag stood for. */
bool SourceFinder::BelongsToAVlan(const Link& device, const std::string& base) const
{
    const auto& files = m_inputs.files;
    return std::any_of(files.begin(), files.end(), [&](const auto& entry) {
        const InterfaceFile& file = entry.second;
        return file.use == FileUse::kPlain && file.name != m_unit.name && file.vlan &&
               file.vlan->parent == base && static_cast<int>(file.vlan->id) == device.vlanId;
    });
}

void SourceFinder::Look(const std::string& base)
{
    const Link* link = m_inputs.live.FindLink(base);
    const bool legacy = base != m_unit.name && m_inputs.live.bonds.contains(base) &&
                        !m_kinship.HeirOf(base).empty();
    const bool replaced = m_unit.kind == UnitKind::kSwitchBond && base == m_unit.name;
    const bool device = link != nullptr && link->kind == kVlanKind && base != m_unit.name &&
                        !Contains(m_kinship.MembersOf(m_unit.name), base);
    const std::string bridge = m_kinship.BridgeFor(base);
    if (base != m_unit.bridge && base != bridge) {
        Add(link, legacy || (!replaced && !device));
    }
    for (const Link& each : m_inputs.live.links) {
        if (link != nullptr && IsTagDevice(each) && each.parent == link->index &&
            !BelongsToAVlan(each, base)) {
            Add(&each, false);
        }
    }
    if (base == m_unit.name) {
        Add(m_unit.bridgeLink, m_unit.BridgeStays());
        return;
    }
    Unit other;
    other.name = base;
    other.bridge = bridge;
    other.target = Target::kPlain;
    other.switchBridge = m_inputs.switchState.Find(bridge);
    if (other.switchBridge != nullptr && other.switchBridge->marked) {
        // From bridge to bridge the old one goes when no traffic waits for that any more.
        const bool stays = m_unit.target == Target::kSwitch || other.BridgeStays();
        Add(m_inputs.live.FindLink(bridge), stays);
    }
}

/**
 * A VLAN's interface whose bond has gone, or has gone on to the switch. What has its name and is no
 * VLAN stays.
 */
bool SourceFinder::IsOnWrongParent() const
{
    if (m_unit.kind != UnitKind::kVlan || m_unit.port == nullptr ||
        m_unit.port->kind != kVlanKind || !m_unit.addWanted) {
        return false;
    }
    const FileVlan& vlan = *m_kinship.UsableFile(m_unit.name)->vlan;
    const std::string parent = m_kinship.ParentFor(vlan);
    return m_inputs.live.FindLink(parent) != nullptr &&
           m_inputs.live.NameOf(m_unit.port->parent) != parent;
}

/** Nothing goes through it, so nobody notices when it joins a bond. */
bool SourceFinder::CanJoinAnyTime(const Link& member) const
{
    const auto& links = m_inputs.live.links;
    const bool carriesVlan = std::any_of(links.begin(), links.end(), [&](const Link& link) {
        return link.kind == kVlanKind && link.parent == member.index;
    });
    return member.master == 0 && !HasAddresses(member) && !(carriesVlan && member.up);
}

/**
 * Whether a new bond reaches the wire before the member that carries the traffic joins it. A
 * partner that speaks LACP leaves that member as soon as it hears of the bond.
 */
bool SourceFinder::CarriesBefore() const
{
    const InterfaceFile* file = m_kinship.UsableFile(m_unit.name);
    return !m_unit.idle.empty() && file != nullptr &&
           BondOptionsOf(*file).Get("mode") != kLacpMode &&
           std::all_of(m_unit.members.begin(), m_unit.members.end(),
                       [](const Link* member) { return member->master == 0; });
}

/** Whether the carrier cannot carry anything before something else has gone or come. */
bool SourceFinder::IsLate() const
{
    if (m_unit.target == Target::kSwitch) {
        return false;
    }
    const bool replaces =
        std::any_of(m_unit.sources.begin(), m_unit.sources.end(), [&](const Source& source) {
            const bool sameVlan = source.link->kind == kVlanKind && m_unit.carrierLink == nullptr &&
                                  (m_unit.tag || m_unit.kind == UnitKind::kVlan);
            return !source.stays && sameVlan;
        });
    const bool gathers = m_unit.kind == UnitKind::kBond &&
                         std::any_of(m_unit.members.begin(), m_unit.members.end(),
                                     [&](const Link* member) { return !CanJoinAnyTime(*member); });
    const bool bridges =
        m_unit.kind == UnitKind::kLinuxBridge &&
        std::any_of(m_unit.members.begin(), m_unit.members.end(), [&](const Link* member) {
            const bool joined = m_unit.port != nullptr && member->master == m_unit.port->index;
            return !joined && !CanJoinAnyTime(*member);
        });
    return replaces || bridges || (gathers && m_unit.port == nullptr && !CarriesBefore());
}

bool SourceFinder::ChangesMode() const
{
    const auto live = m_inputs.live.bonds.find(m_unit.name);
    const InterfaceFile* file = m_kinship.UsableFile(m_unit.name);
    if (m_unit.kind != UnitKind::kBond || m_unit.port == nullptr || !m_unit.addWanted ||
        file == nullptr || live == m_inputs.live.bonds.end()) {
        return false;
    }
    const std::string wanted = BondOptionsOf(*file).Get("mode");
    const auto mode = live->second.options.find("mode");
    return !wanted.empty() && mode != live->second.options.end() && mode->second != wanted;
}

void SourceFinder::Run()
{
    Absorb();
    NameCarrier();
    if (IsOnWrongParent()) {
        m_unit.rebuilt = true;
        const Link* carrier = m_unit.carrierLink;
        const bool isOnIt = carrier != nullptr && carrier->parent == m_unit.port->index;
        if (isOnIt) {
            m_unit.sources.push_back({carrier, false}); // it would go with what it is on
        }
        m_unit.sources.push_back({m_unit.port, false});
        if (isOnIt || carrier == m_unit.port) {
            m_unit.carrierLink = nullptr;
        }
    }
    Look(m_unit.name);
    for (const std::string& base : m_unit.absorbed) {
        Look(base);
    }
    if (m_unit.kind == UnitKind::kVlan) {
        const InterfaceFile* file = m_kinship.UsableFile(m_unit.name);
        for (const Link& each : m_inputs.live.links) {
            if (file != nullptr && IsTagDevice(each) &&
                each.vlanId == static_cast<int>(file->vlan->id) &&
                m_inputs.live.NameOf(each.parent) == file->vlan->parent) {
                Add(&each, false);
            }
        }
    }
    std::stable_partition(m_unit.sources.begin(), m_unit.sources.end(),
                          [&](const Source& source) { return HasAddresses(*source.link); });
    if (m_unit.IsGroup()) {
        std::copy_if(m_unit.members.begin(), m_unit.members.end(), std::back_inserter(m_unit.idle),
                     [&](const Link* member) { return CanJoinAnyTime(*member); });
    }
    m_unit.late = IsLate();
    m_unit.changesMode = ChangesMode();
}

} // namespace

BondOptions BondOptionsOf(const InterfaceFile& file)
{
    std::string text;
    for (const auto& [name, value] : file.bondOptions) {
        text += name;
        text += '=';
        text += value;
        text += ' ';
    }
    return BondOptions::Parse(text);
}

void FindSources(const Inputs& inputs, const Kinship& kinship, Unit& unit)
{
    SourceFinder(inputs, kinship, unit).Run();
}

} // namespace vornhost
