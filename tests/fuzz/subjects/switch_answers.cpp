/**
 * What the switch's tool prints. The text is its list of bridges, a line of its own with "%", how
 * the question for a tag ends, and what is answered to that.
 */
#include "platform.h"
#include "subject.h"
#include "text.h"

#include <vornovs/vornovs.h>

#include <cstdlib>
#include <set>

namespace {

using fuzz::Expect;

constexpr std::size_t kLongestLine = 1023;
constexpr char kPort[] = "ovs_eth0";

/** What a line by line scan for one word leaves. */
std::set<std::string> Bridges(const std::string& text)
{
    constexpr char kWhiteSpace[] = " \t\n\v\f\r";
    std::set<std::string> bridges;
    std::string word;
    for (const std::string& whole : fuzz::LinesOf(text)) {
        // As it is read: in parts of a buffer's size, each up to its first NUL.
        for (std::size_t at = 0; at < whole.size(); at += kLongestLine) {
            const std::string part = whole.substr(at, kLongestLine).c_str();
            const auto begin = part.find_first_not_of(kWhiteSpace);
            if (begin != std::string::npos) {
                word = part.substr(begin, part.find_first_of(kWhiteSpace, begin) - begin);
            }
            bridges.insert(word);
        }
    }
    return bridges;
}

void CheckTag(const fuzz::SwitchAnswers& answers)
{
    const std::string line = answers.tag.substr(0, answers.tag.find('\n')).c_str();
    _tag_VLIB_VLAN tag{};
    const int result = VORN::OVS::VlanManager::Get(kPort, &tag);
    const bool failed = answers.status != 0;
    const bool none = line.starts_with("[]");
    Expect(result == (failed ? -1 : none ? 0 : 1), "the answer about a tag is taken wrongly");
    const int id = static_cast<int>(std::strtoul(line.c_str(), nullptr, 10));
    Expect(tag.vlanId == (result == 1 ? id : 0), "the tag is another one");
    Expect(std::string(tag.szIfName) == kPort && std::string(tag.szRealName) == kPort,
           "the record names another port");
}

void Run(std::string_view text)
{
    fuzz::SwitchAnswers& answers = fuzz::Answers();
    answers.bridges = fuzz::TakeUpTo("\n%\n", text);
    answers.status = static_cast<int>(std::strtol(fuzz::TakeUpTo("\n", text).c_str(), nullptr, 10));
    answers.tag = text;

    VORN::OVS::OVSManager manager;
    std::set<std::string> bridges{"former"};
    Expect(manager.GetSwitchList(bridges) == 0, "the list of bridges cannot be read");
    Expect(bridges == Bridges(answers.bridges), "other bridges are read than were printed");
    CheckTag(answers);
}

const fuzz::Subject kSubject("switch_answers", Run);

} // namespace
