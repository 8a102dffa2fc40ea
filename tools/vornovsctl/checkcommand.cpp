#include "check/halfstates.h"
#include "check/hosttruths.h"
#include "commands.h"

namespace vornovsctl {

namespace {

Json FieldsOf(const std::vector<HalfState>& found)
{
    Json fields;
    fields["halfStates"] = Json::array();
    for (const HalfState& each : found) {
        fields["halfStates"].push_back(
            {{"class", WordOf(each.kind)}, {"subject", each.subject}, {"text", each.text}});
    }
    return fields;
}

} // namespace

Answer Check(const Context& /*context*/)
{
    const HostTruths truths = ReadTruths();
    const std::vector<HalfState> found = FindHalfStates(truths);
    Answer answer;
    answer.fields = FieldsOf(found);
    for (const HalfState& each : found) {
        answer.text += each.subject + ' ' + each.text + ".\n";
    }
    for (const std::string& fault : truths.host.unread) {
        answer.error += (answer.error.empty() ? "" : "\n") + fault + '.';
    }
    if (!found.empty()) {
        answer.exitStatus = ExitStatusOf(found.front().kind);
    } else if (!answer.error.empty()) {
        answer.exitStatus = kDoesNotHold;
    } else {
        answer.text = "Everything fits together.\n";
    }
    return answer;
}

} // namespace vornovsctl
