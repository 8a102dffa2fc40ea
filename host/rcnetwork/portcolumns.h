/**
 * What the row of a bond on the switch shall say, and how to bring it there.
 */
#ifndef VORNHOST_RCNETWORK_PORTCOLUMNS_H
#define VORNHOST_RCNETWORK_PORTCOLUMNS_H

#include "plan.h"

#include <string>
#include <vector>

namespace vornhost {

/** The external id under which it is kept which columns were set. */
constexpr char kOptionsKey[] = "vornovs-options";

class PortColumns {
public:
    /** @param former  the kernel's bond that this one stands in for; null when there is none. */
    PortColumns(const InterfaceFile& file, const FormerBond* former);

    /** @return  why the switch could not run the bond with these options; empty when it can. */
    std::string Objection() const;

    /**
     * One thing that the switch does not know would keep it from all that it is told with it.
     * @return  what is wrong with each option that is therefore left out
     */
    const std::vector<std::string>& Refusals() const { return m_refusals; }

    /** @return  " COLUMN=VALUE..." of what differs, with what is remembered; or nothing. */
    std::string Changes(const SwitchPort* live, bool wanted) const;

    /** @return  the commands that clear what earlier options had set and these do not. */
    std::vector<std::string> Removals(const std::string& port, const SwitchPort* live,
                                      bool wanted) const;

    bool SpeaksLacp() const;

private:
    std::string Get(const std::string& name) const;
    std::string Keys() const;
    void Take(const std::string& name, const std::string& value);

    SwitchValues m_values; ///< By column, or "other_config:KEY".
    std::vector<std::string> m_refusals;
    bool m_hasOptions = false;
};

} // namespace vornhost

#endif
