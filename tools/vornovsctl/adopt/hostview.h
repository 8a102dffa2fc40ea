/**
 * What can be asked of a host: its files, its programs and its kernel. Tests put another one below.
 */
#ifndef VORNOVSCTL_ADOPT_HOSTVIEW_H
#define VORNOVSCTL_ADOPT_HOSTVIEW_H

#include <functional>
#include <map>
#include <optional>
#include <string>
#include <support/bondoptions.h>
#include <support/livesettings.h>
#include <vector>

namespace vornovsctl {

struct HostView {
    std::string root; /**< put before every path; empty: the host's own files */
    /** Runs a program that only tells something. @return its output; nothing: it failed. */
    std::function<std::optional<std::string>(const std::vector<std::string>& argv)> run;
    vornhost::LiveNetwork live;
    std::map<std::string, vornhost::BondOptions> liveBonds; /**< by their names */

    /** The host as it is at this moment. */
    static HostView Now();

    /** @return nothing: there is no such file, or it cannot be read. */
    std::optional<std::string> Text(const std::string& path) const;
    bool Exists(const std::string& path) const;
    /** @return the paths that a pattern of a shell stands for, sorted; without the root. */
    std::vector<std::string> Find(const std::string& pattern) const;

    const vornhost::Link* LinkOf(int index) const;
    std::string NameOf(int index) const;
    /** The members of a live bond or bridge. */
    std::vector<std::string> MembersOf(const std::string& master) const;
};

} // namespace vornovsctl

#endif
