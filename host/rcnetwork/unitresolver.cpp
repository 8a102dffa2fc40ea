#include "unitplan.h"

namespace vornhost {
namespace {

std::string Text(const InterfaceFile& file)
{
    std::string text;
    for (const std::string& server : file.nameServers) {
        text += " server " + server;
    }
    for (const std::string& domain : file.searchDomains) {
        text += " domain " + domain;
    }
    return text;
}

} // namespace

/** What the file itself says of name servers is told under the name of the carrier. */
void UnitPlanner::PlanResolver()
{
    std::string wanted;
    if (m_unit.addWanted && !m_unit.takeDown && !Text(*m_unit.file).empty()) {
        wanted = Carrier() + Text(*m_unit.file);
    } else if (!m_unit.removeUnwanted && !m_former.resolver.empty()) {
        wanted = Carrier() + m_former.resolver.substr(m_former.resolver.find(' '));
    }
    const std::string former = m_former.resolver.substr(0, m_former.resolver.find(' '));
    if (wanted != m_former.resolver) {
        if (!wanted.empty()) {
            m_steps.resolver.push_back("tell " + wanted);
        }
        if (!former.empty() && (wanted.empty() || former != Carrier())) {
            m_steps.resolver.push_back("forget " + former);
        }
    }
    m_record.resolver = wanted;
}

} // namespace vornhost
