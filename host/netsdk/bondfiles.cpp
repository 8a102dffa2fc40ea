#include "bondfiles.h"

#include "bondmodes.h"

#include "support/contains.h"
#include "support/filestates.h"
#include "support/settings.h"

#include <algorithm>

namespace vornhost {
namespace {

constexpr char kOptions[] = "BONDING_OPTS";

KeyValueFile NewFile(const std::string& interface)
{
    return KeyValueFile::Parse("DEVICE=" + interface + "\nBOOTPROTO=none\nONBOOT=yes\n");
}

bool HasFile(const FileStates& states, const std::string& interface)
{
    const auto state = states.find(interface);
    return state != states.end() && state->second.text;
}

/** The file of the state, or a new one. */
KeyValueFile FileOrNew(const FileStates& states, const std::string& interface)
{
    return HasFile(states, interface) ? FileOf(states, interface) : NewFile(interface);
}

unsigned FileMode(const FileStates& states, const std::string& interface)
{
    const auto state = states.find(interface);
    return state == states.end() ? FileState{}.mode : state->second.mode;
}

void RemoveKeys(KeyValueFile& file, const std::vector<std::string>& keys)
{
    for (const std::string& key : keys) {
        (void)file.Remove(key);
    }
}

bool IsSlaveOf(const KeyValueFile& file, const std::string& bond)
{
    return file.Get("MASTER") == bond && file.Get("SLAVE") == "yes";
}

void MakeSlave(const std::string& bond, KeyValueFile& file)
{
    if (!IsSlaveOf(file, bond)) {
        (void)file.Set("MASTER", bond);
        (void)file.Set("SLAVE", "yes");
    }
}

/** The bond's file as that of the slave that takes its place. */
KeyValueFile FirstSlavesFile(const BondPlan& plan, const FileStates& before)
{
    const std::string& slave = plan.slaves[0];
    const KeyValueFile own = FileOrNew(before, slave);
    KeyValueFile file = own;
    if (HasFile(before, plan.name)) {
        file = FileOf(before, plan.name);
        (void)file.Set("DEVICE", slave);
        RemoveKeys(file, {kOptions, "BONDING_MASTER", "TYPE", "HWADDR", "MACADDR", "ETHTOOL_OPTS"});
        for (const std::string& key : own.Keys()) {
            if (IsCardKey(key)) {
                (void)file.Set(key, *own.GetWritten(key));
            }
        }
    } else {
        ReplaceAddressing(plan.live, file);
    }
    RemoveKeys(file, {"MASTER", "SLAVE"});
    // The slaves' MTU was the bond's; what becomes of them must not fall back to the usual one.
    if (const auto mtu = plan.live.Get("MTU"); mtu && !file.Get("MTU")) {
        (void)file.Set("MTU", *mtu);
    }
    return file;
}

KeyValueFile OtherSlavesFile(const std::string& slave, const FileStates& before,
                             const KeyValueFile& first)
{
    KeyValueFile file = FileOrNew(before, slave);
    RemoveKeys(file, {"MASTER", "SLAVE"});
    RemoveAddressing(file);
    if (const auto mtu = first.GetWritten("MTU")) {
        (void)file.Set("MTU", *mtu);
    }
    if (file.Get("ONBOOT") == "no" && first.Get("ONBOOT") != "no") {
        (void)file.Set("ONBOOT", "yes"); // it was up for the bond's sake
    }
    return file;
}

/** One bond on its way back. */
class Builder {
public:
    Builder(const BondPlan& plan, const FileStates& current,
            const std::optional<RememberedBond>& memory)
        : m_plan(plan), m_current(current), m_memory(memory)
    {
    }

    BuiltBond Build()
    {
        BuildBond();
        for (const std::string& slave : m_plan.slaves) {
            BuildSlave(slave);
        }
        return m_built;
    }

private:
    const std::string& First() const { return m_plan.slaves[0]; }

    void Put(const std::string& interface, const KeyValueFile& build,
             const std::optional<KeyValueFile>& final)
    {
        const unsigned mode = FileMode(m_memory ? m_memory->state.before : m_current, interface);
        m_built.build[interface] = {build.Text(), mode};
        m_built.final[interface] =
            final ? FileState{final->Text(), mode} : FileState{std::nullopt, mode};
    }

    /** The bond's file; temporary where the administrator had none and asked for nothing. */
    KeyValueFile BondsFile(bool& temporary)
    {
        if (HasFile(m_current, m_plan.name)) {
            return FileOf(m_current, m_plan.name);
        }
        const KeyValueFile carrier = FileOf(m_current, First());
        if (m_memory) {
            const auto notOfCard = [](const std::string& key) { return !IsCardKey(key); };
            const RememberedState& state = m_memory->state;
            const bool hadFile = HasFile(state.before, m_plan.name);
            KeyValueFile file = hadFile ? FileOf(state.before, m_plan.name) : FromCarrier(carrier);
            KeyValueFile unused = file;
            const bool changed = CarryChanges(FileOf(state.moved, m_memory->slaves[0]), carrier,
                                              notOfCard, hadFile ? file : unused);
            temporary = !hadFile && !changed;
            return file;
        }
        return FromCarrier(carrier);
    }

    /** A file for a bond that never had one: all of its first slave's. */
    KeyValueFile FromCarrier(KeyValueFile file) const
    {
        if (file.Text().empty()) {
            file = NewFile(m_plan.name);
            ReplaceAddressing(m_plan.live, file);
        }
        RemoveKeys(file,
                   {kOptions, "BRIDGE", "HWADDR", "MACADDR", "MASTER", "PRIMARY", "SLAVE", "TYPE"});
        (void)file.Set("DEVICE", m_plan.name);
        return file;
    }

    /** What was in effect, without what a new bond has anyway. */
    BondOptions RememberedOptions(const BondOptions& named) const
    {
        if (!m_memory) {
            return {};
        }
        const std::string mode = ModeOf(m_plan, m_memory);
        const bool sameMode = m_memory->options.Get("mode") == mode;
        BondOptions options =
            (sameMode ? m_memory->options : m_memory->options.WithMode(mode)).Chosen(named);
        if (!Contains(m_plan.slaves, options.Get("primary"))) {
            options.values.erase("primary");
        }
        return options;
    }

    void BuildBond()
    {
        bool temporary = false;
        KeyValueFile file = BondsFile(temporary);
        const std::string mode = ModeOf(m_plan, m_memory);
        const BondOptions written = BondOptions::Parse(file.Get(kOptions).value_or(""));
        const std::string standing = written.Get("mode").empty() && m_memory
                                         ? m_memory->options.Get("mode")
                                         : written.Get("mode");
        if (standing != mode) {
            const BondOptions options = written.values.empty() ? RememberedOptions({}) : written;
            SetOptions(options.WithMode(mode), file);
        }
        KeyValueFile build = file;
        const BondOptions named = BondOptions::Parse(file.Get(kOptions).value_or(""));
        const BondOptions all = named.OverlaidWith(RememberedOptions(named));
        if (all != named) {
            SetOptions(all, build);
        }
        Put(m_plan.name, build, temporary ? std::nullopt : std::optional<KeyValueFile>(file));
    }

    static void SetOptions(const BondOptions& options, KeyValueFile& file)
    {
        (void)file.Set(kOptions, '"' + options.Text() + '"');
    }

    void BuildSlave(const std::string& slave)
    {
        const KeyValueFile current = FileOf(m_current, slave);
        if (HasFile(m_current, slave) && IsSlaveOf(current, m_plan.name)) {
            Put(slave, current, current);
            return;
        }
        const bool remembered = m_memory && m_memory->state.before.contains(slave);
        if (!remembered) {
            KeyValueFile file = FileOrNew(m_current, slave);
            RemoveKeys(file, {"BRIDGE"});
            RemoveAddressing(file);
            MakeSlave(m_plan.name, file);
            Put(slave, file, file);
            return;
        }

        KeyValueFile file = FileOrNew(m_memory->state.before, slave);
        // What was carried by it has gone to the bond; an address means nothing to a slave.
        const bool carrier = slave == First() || slave == m_memory->slaves[0];
        const auto isOwn = [&](const std::string& key) {
            return carrier ? IsCardKey(key) : !IsAddressingKey(key);
        };
        const bool changed =
            CarryChanges(FileOf(m_memory->state.moved, slave), current, isOwn, file);
        const bool stays = HasFile(m_memory->state.before, slave) || changed;
        const std::optional<KeyValueFile> final =
            stays ? std::optional<KeyValueFile>(file) : std::nullopt;
        MakeSlave(m_plan.name, file);
        Put(slave, file, final);
    }

    const BondPlan& m_plan;
    const FileStates& m_current;
    const std::optional<RememberedBond>& m_memory;
    BuiltBond m_built;
};

} // namespace

FileStates TakenApart(const BondPlan& plan, const FileStates& before)
{
    FileStates moved;
    const KeyValueFile first = FirstSlavesFile(plan, before);
    moved[plan.slaves[0]] = {first.Text(), FileMode(before, plan.slaves[0])};
    for (std::size_t index = 1; index < plan.slaves.size(); ++index) {
        const std::string& slave = plan.slaves[index];
        moved[slave] = {OtherSlavesFile(slave, before, first).Text(), FileMode(before, slave)};
    }
    moved[plan.name] = {};
    return moved;
}

std::string ModeOf(const BondPlan& plan, const std::optional<RememberedBond>& memory)
{
    const std::string remembered = memory ? memory->options.Get("mode") : "";
    return ModeAfterSwitch(remembered) == plan.mode ? remembered : plan.mode;
}

BuiltBond Built(const BondPlan& plan, const FileStates& current,
                const std::optional<RememberedBond>& memory)
{
    return Builder(plan, current, memory).Build();
}

bool IsHalfTakenApart(const RememberedState& memory, const FileStates& current)
{
    bool unchanged = true;
    for (const auto& [interface, state] : current) {
        const auto before = memory.before.find(interface);
        const auto moved = memory.moved.find(interface);
        if (before == memory.before.end() || moved == memory.moved.end()) {
            return false;
        }
        if (state.text == before->second.text) {
            continue;
        }
        unchanged = false;
        const bool sameKind = state.text.has_value() == moved->second.text.has_value();
        const KeyValueFile file = FileOf(current, interface);
        if (!sameKind || file.Get("MASTER") ||
            !SameSettings(FileOf(memory.moved, interface), file)) {
            return false;
        }
    }
    return !unchanged;
}

} // namespace vornhost
