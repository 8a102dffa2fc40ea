#include "pairplan.h"

namespace vornhost {
namespace {

void Append(std::vector<std::string>& lines, const std::vector<std::string>& more)
{
    lines.insert(lines.end(), more.begin(), more.end());
}

} // namespace

std::vector<std::string> BatchParts::Lines() const
{
    std::vector<std::string> lines;
    for (const auto* part : {&links, &addresses, &neighbours, &routes, &defaultRoutes,
                             &removedRoutes, &removedNeighbours, &removedAddresses, &linksDown}) {
        Append(lines, *part);
    }
    return lines;
}

PairPlanner::PairPlanner(const Inputs& inputs, const Pair& pair, Steps& steps,
                         std::vector<Remark>& remarks)
    : m_inputs(inputs), m_pair(pair), m_steps(steps), m_remarks(remarks)
{
    const auto former = inputs.runState.interfaces.find(pair.name);
    if (former != inputs.runState.interfaces.end()) {
        m_former = former->second;
    }
    m_record = m_former;
}

std::string PairPlanner::Live(const std::string& interface, const std::string& setting) const
{
    return m_inputs.live.Setting(interface, setting);
}

void PairPlanner::Run()
{
    if (m_pair.waitsForSwitch) {
        m_steps.needsSwitch = true;
    }
    PlanBridge();
    PlanLinks();
    if (m_moves) {
        CarrySettings();
        MoveIpv6Stack();
    } else {
        KeepIpv6Stack();
    }
    PlanAutoconf();
    PlanAddresses();
    if (m_moves) {
        CarryNeighbours();
    }
    if (m_pair.takeDown) {
        PlanFormerLink();
    }
    m_steps.records[m_pair.name] = m_record;
}

} // namespace vornhost
