#include "check/halfstates.h"
#include "check/hosttruths.h"
#include "check/repair.h"
#include "commands.h"

namespace vornovsctl {

namespace {

constexpr int kMostRounds = 3; // a conversion may show what one that was cut short has hidden

constexpr char kWhole[] = "Everything fits together.\n";

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

std::string TextOf(const std::vector<HalfState>& found)
{
    std::string text;
    for (const HalfState& each : found) {
        text += each.subject + ' ' + each.text + ".\n";
    }
    return text;
}

std::string Unread(const HostTruths& truths)
{
    std::string text;
    for (const std::string& fault : truths.host.unread) {
        text += (text.empty() ? "" : "\n") + fault + '.';
    }
    return text;
}

std::string TextOf(const std::vector<RepairStep>& plan)
{
    std::string text;
    for (const RepairStep& step : plan) {
        text += "  " + TextOf(step) + '\n';
    }
    return text;
}

/** Goes the way from half states to a whole one, looking again after each round. */
class Repairing {
public:
    explicit Repairing(const Context& context) : m_context(context) { Look(); }

    Answer Run()
    {
        if (!m_truths.host.unread.empty()) {
            return Failed(kDoesNotHold,
                          Unread(m_truths) + "\nNothing was changed: what cannot be read cannot "
                                             "be judged.",
                          Fields());
        }
        if (m_context.arguments.dryRun) {
            const auto plan = PlanRepair(m_truths, m_found);
            Remember(plan);
            return Done(m_found.empty() ? kWhole : TextOf(m_found) + "To do:\n" + TextOf(plan),
                        Fields());
        }
        for (int round = 0; round < kMostRounds && !m_found.empty(); ++round) {
            Repair();
        }
        if (m_found.empty() && m_truths.host.unread.empty()) {
            // All that it names is there again, and may be taken away from now on.
            (void)vornhost::ConversionRecord{}.Save();
            return Done(kWhole, Fields());
        }
        return Failed(m_found.empty() ? kDoesNotHold : ExitStatusOf(m_found.front().kind),
                      "not mended:\n" + TextOf(m_found) + Unread(m_truths) +
                          "See the system log for the reason.",
                      Fields());
    }

private:
    void Look()
    {
        m_truths = ReadTruths();
        m_found = FindHalfStates(m_truths);
    }

    void Repair()
    {
        const auto plan = PlanRepair(m_truths, m_found);
        m_context.tell(TextOf(m_found) + "To do:\n" + TextOf(plan));
        Remember(plan);
        // Whatever fails, clients that were taken out are to be registered again.
        for (const RepairStep& step : plan) {
            TakeStep(step);
        }
        Look();
    }

    void Remember(const std::vector<RepairStep>& plan)
    {
        for (const RepairStep& step : plan) {
            m_steps.push_back(TextOf(step));
        }
    }

    Json Fields() const
    {
        Json fields = FieldsOf(m_found);
        fields["steps"] = m_steps;
        return fields;
    }

    const Context& m_context;
    HostTruths m_truths;
    std::vector<HalfState> m_found;
    std::vector<std::string> m_steps;
};

} // namespace

Answer Check(const Context& /*context*/)
{
    const HostTruths truths = ReadTruths();
    const std::vector<HalfState> found = FindHalfStates(truths);
    Answer answer;
    answer.fields = FieldsOf(found);
    answer.text = TextOf(found);
    answer.error = Unread(truths);
    if (!found.empty()) {
        answer.exitStatus = ExitStatusOf(found.front().kind);
    } else if (!answer.error.empty()) {
        answer.exitStatus = kDoesNotHold;
    } else {
        answer.text = kWhole;
    }
    return answer;
}

Answer Repair(const Context& context)
{
    return Repairing(context).Run();
}

} // namespace vornovsctl
