#include "recordingplatform/recordingplatform.h"

#include "recordingplatform/recorder.h"

#include <algorithm>
#include <cstring>
#include <ostream>
#include <utility>

#include <syslog.h>

namespace harness {

namespace {

template <std::size_t size>
void CopyName(char (&field)[size], const std::string& name)
{
    name.copy(field, size - 1);
}

} // namespace

LogLine Err(const std::string& file, const std::string& text)
{
    return {LOG_ERR, file, text};
}

LogLine Info(const std::string& file, const std::string& text)
{
    return {LOG_INFO, file, text};
}

void PrintTo(const LogLine& line, std::ostream* out)
{
    *out << "<" << line.priority << "> " << line.file << ": \"" << line.text << "\"";
}

VORNLINKAGGROPT BondRecord(const std::string& name, int mode,
                           const std::vector<std::string>& slaves)
{
    VORNLINKAGGROPT record{};
    CopyName(record.szMaster, name);
    record.mode = static_cast<VORN_LINK_AGGR_MODE>(mode);
    record.reserved = 0x5A5A;
    for (const std::string& slave : slaves) {
        CopyName(record.rgszSlave[record.nSlave], slave);
        ++record.nSlave;
    }
    return record;
}

RecordingPlatform::RecordingPlatform() : m_recorder(std::make_unique<Recorder>()) {}

RecordingPlatform::~RecordingPlatform() = default;

void RecordingPlatform::Answer(const std::string& call, int result)
{
    m_recorder->m_rules.push_back({call, 0, result, 0});
}

void RecordingPlatform::React(std::function<std::optional<int>(const std::string& call)> reaction)
{
    m_recorder->m_reaction = std::move(reaction);
}

void RecordingPlatform::NoVlansAndBonds()
{
    m_recorder->m_vlans.clear();
    m_recorder->m_bonds.clear();
}

void RecordingPlatform::AnswerNth(const std::string& call, int nth, int result)
{
    m_recorder->m_rules.push_back({call, nth, result, 0});
}

void RecordingPlatform::Output(const std::string& call, const std::string& text, int status)
{
    auto& outputs = m_recorder->m_outputs;
    std::erase_if(outputs, [&](const auto& output) { return output.first == call; });
    outputs.emplace_back(call, Recorder::ProgramOutput{text, status});
}

void RecordingPlatform::OutputOnce(const std::string& text, int status)
{
    m_recorder->m_nextOutput = {text, status};
}

void RecordingPlatform::Intercept(std::function<std::optional<int>(const std::string& call)> answer)
{
    m_recorder->m_interception = std::move(answer);
}

void RecordingPlatform::Around(std::function<void()> before, std::function<void()> after)
{
    m_recorder->m_before = std::move(before);
    m_recorder->m_after = std::move(after);
}

void RecordingPlatform::TakeRealLocks()
{
    m_recorder->m_takesRealLocks = true;
}

void RecordingPlatform::Interfaces(const std::vector<std::string>& names)
{
    m_recorder->m_interfaces = names;
}

void RecordingPlatform::Vlan(const std::string& name, const std::string& parent, int id)
{
    _tag_VLIB_VLAN vlan{};
    CopyName(vlan.szIfName, name);
    CopyName(vlan.szRealName, parent);
    vlan.vlanId = id;
    m_recorder->m_vlans[name] = vlan;
}

void RecordingPlatform::Vlan(const std::string& name, const _tag_VLIB_VLAN& record)
{
    m_recorder->m_vlans[name] = record;
}

void RecordingPlatform::Bond(const std::string& name, int mode,
                             const std::vector<std::string>& slaves)
{
    m_recorder->m_bonds[name] = BondRecord(name, mode, slaves);
}

void RecordingPlatform::Bond(const std::string& name, const VORNLINKAGGROPT& record)
{
    m_recorder->m_bonds[name] = record;
}

void RecordingPlatform::Conflict(const std::string& bond, const std::string& name)
{
    m_recorder->m_conflicts[bond] = name;
}

void RecordingPlatform::Value(const std::string& path, const std::string& key,
                              const std::string& value)
{
    m_recorder->m_values[{path, key}] = value;
}

void RecordingPlatform::LinkSpeeds(const std::string& name, const std::vector<int>& speeds)
{
    m_recorder->m_links[name] = {speeds, 0};
}

void RecordingPlatform::FillNamesWhole()
{
    m_recorder->m_fillNamesWhole = true;
}

void RecordingPlatform::LockHandle(int handle)
{
    m_recorder->m_lockHandle = handle;
}

void RecordingPlatform::CarryOutFileEdits()
{
    m_recorder->m_carryOutEdits = true;
}

const std::vector<std::string>& RecordingPlatform::Calls() const
{
    return m_recorder->m_calls;
}

const std::vector<std::string>& RecordingPlatform::AllCalls() const
{
    return m_recorder->m_allCalls;
}

const std::vector<LogLine>& RecordingPlatform::Log() const
{
    return m_recorder->m_log;
}

void RecordingPlatform::Forget()
{
    m_recorder->m_calls.clear();
    m_recorder->m_allCalls.clear();
    m_recorder->m_log.clear();
}

std::vector<std::string> RecordingPlatform::OpenHandles() const
{
    std::vector<std::string> result;
    for (const auto& [handle, open] : m_recorder->m_open) {
        result.push_back(open.what);
    }
    if (m_recorder->m_heldLock != -1) {
        result.emplace_back("the lock file");
    }
    if (m_recorder->m_platformLockHolder != std::thread::id()) {
        result.emplace_back("the platform's file lock");
    }
    return result;
}

} // namespace harness
