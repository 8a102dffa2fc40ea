#include "unitplan.h"

#include <algorithm>

namespace vornhost {
namespace {

std::string Text(const LinkCommand& command)
{
    std::string text;
    for (const std::string& word : command) {
        text += (text.empty() ? "" : " ") + word;
    }
    return text;
}

} // namespace

/** Settings of cards stay where they are while addresses move, so each is made once. */
void UnitPlanner::PlanCards()
{
    if (!m_unit.addWanted || m_unit.takeDown) {
        return;
    }
    std::vector<const Link*> links = m_unit.Ports();
    links.insert(links.end(), m_unit.members.begin(), m_unit.members.end());
    links.insert(links.end(), m_unit.further.begin(), m_unit.further.end());
    std::set<std::string> seen;
    for (const Link* link : links) {
        if (seen.insert(link->name).second) {
            PlanCard(*link);
        }
    }
}

void UnitPlanner::PlanCard(const Link& link)
{
    const InterfaceFile* file = m_kinship.UsableFile(link.name);
    if (file == nullptr) {
        return;
    }
    std::string made;
    for (const LinkCommand& command : file->linkCommands) {
        made += (made.empty() ? "" : "; ") + Text(command);
    }
    InterfaceRecord& record = link.name == m_unit.name ? m_record : m_steps.records[link.name];
    const std::string former = FormerRecord(link.name).linkCommands;
    record.linkCommands = made;
    if (made == former) {
        return;
    }
    for (const LinkCommand& command : file->linkCommands) {
        m_steps.cards.push_back(link.name + " " + Text(command));
    }
}

} // namespace vornhost
