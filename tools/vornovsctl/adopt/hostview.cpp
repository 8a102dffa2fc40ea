#include "adopt/hostview.h"

#include <algorithm>
#include <array>
#include <fstream>
#include <glob.h>
#include <sstream>
#include <support/process.h>
#include <unistd.h>

namespace vornovsctl {

namespace {

constexpr std::chrono::seconds kLongestAnswer{20};

std::optional<std::string> OutputOf(const std::vector<std::string>& argv)
{
    // Programs are where Debian has them, and not everywhere merged into one folder.
    constexpr std::array kFolders{"/usr/bin/", "/usr/sbin/", "/bin/", "/sbin/"};
    for (const char* folder : kFolders) {
        std::vector<std::string> words = argv;
        words[0].insert(0, folder);
        if (access(words[0].c_str(), X_OK) == 0) {
            vornhost::ProcessOptions options;
            options.deadline = kLongestAnswer;
            const vornhost::ProcessResult result = vornhost::RunProcess(words, options);
            return result.Succeeded() ? std::optional(result.output) : std::nullopt;
        }
    }
    return std::nullopt;
}

} // namespace

HostView HostView::Now()
{
    HostView view;
    view.run = OutputOf;
    view.live = vornhost::LiveNetwork::Read();
    for (const vornhost::Link& link : view.live.links) {
        if (const auto options = vornhost::BondOptions::ReadLive(link.name);
            link.kind == "bond" && options) {
            view.liveBonds[link.name] = *options;
        }
    }
    return view;
}

std::optional<std::string> HostView::Text(const std::string& path) const
{
    std::ifstream file(root + path);
    std::ostringstream text;
    if (!file || !(text << file.rdbuf())) {
        return file && file.peek() == std::ifstream::traits_type::eof() ? std::optional("")
                                                                        : std::nullopt;
    }
    return text.str();
}

bool HostView::Exists(const std::string& path) const
{
    return access((root + path).c_str(), F_OK) == 0;
}

std::vector<std::string> HostView::Find(const std::string& pattern) const
{
    glob_t found{};
    std::vector<std::string> paths;
    if (glob((root + pattern).c_str(), 0, nullptr, &found) == 0) {
        for (std::size_t index = 0; index < found.gl_pathc; ++index) {
            paths.push_back(std::string(found.gl_pathv[index]).substr(root.size()));
        }
    }
    globfree(&found);
    return paths;
}

const vornhost::Link* HostView::LinkOf(int index) const
{
    const auto link = std::find_if(live.links.begin(), live.links.end(),
                                   [&](const vornhost::Link& each) { return each.index == index; });
    return link == live.links.end() ? nullptr : &*link;
}

std::string HostView::NameOf(int index) const
{
    const vornhost::Link* const link = LinkOf(index);
    return link == nullptr ? "" : link->name;
}

std::vector<std::string> HostView::MembersOf(const std::string& master) const
{
    const vornhost::Link* const link = live.Find(master);
    std::vector<std::string> members;
    for (const vornhost::Link& each : live.links) {
        if (link != nullptr && each.master == link->index) {
            members.push_back(each.name);
        }
    }
    return members;
}

} // namespace vornovsctl
