#include "adopt/adoption.h"
#include "adopt/boundaries.h"
#include "adopt/handover.h"
#include "adopt/livecheck.h"
#include "adopt/networkdreader.h"
#include "adopt/networkmanagerreader.h"
#include "adopt/report.h"
#include "commands.h"
#include "hoststate.h"
#include "wording.h"

#include <algorithm>
#include <chrono>
#include <support/runlock.h>
#include <thread>

namespace vornovsctl {

namespace {

constexpr char kLockName[] = "adopt.lock";
constexpr int kLockSeconds = 60;
// A client that goes on with a lease has it at once; one that finds no server waits in vain.
constexpr std::chrono::seconds kSettlingTime{25};
constexpr std::chrono::milliseconds kBetweenGlances{250};

std::set<std::string> NamesOf(const Context& context)
{
    const auto& list = context.arguments.All("INTERFACE");
    return {list.begin(), list.end()};
}

/** @return what of it does not come back in time. */
Belongings WaitFor(const Belongings& before, const std::set<std::string>& names)
{
    Belongings missing;
    for (auto waited = std::chrono::milliseconds(0); waited <= kSettlingTime;
         waited += kBetweenGlances) {
        missing = Missing(before, BelongingsOf(HostView::Now(), names));
        if (missing.empty()) {
            break;
        }
        std::this_thread::sleep_for(kBetweenGlances);
    }
    return missing;
}

/** Whether managers are done with interfaces that they got back; without a cable they never are. */
bool AreSettled(const AdoptionRecord& record, const std::set<std::string>& names)
{
    const HostView host = HostView::Now();
    const auto devices = ReadNetworkManagerDevices(host);
    const auto links = ReadNetworkdLinks(host);
    return std::all_of(
        record.interfaces.begin(), record.interfaces.end(), [&](const AdoptedInterface& interface) {
            const vornhost::Link* const link = host.live.Find(interface.name);
            if (!names.contains(interface.name) || link == nullptr || !link->carrier) {
                return true;
            }
            const auto device = devices.find(interface.name);
            const auto network = links.find(interface.name);
            return (interface.manager != Manager::kNetworkManager ||
                    (device != devices.end() && device->second.settled)) &&
                   (interface.manager != Manager::kNetworkd ||
                    (network != links.end() && network->second.settled));
        });
}

/** The same for interfaces that managers have got back. */
Belongings WaitForManagers(const AdoptionRecord& record, const LooseEnds& ends,
                           const Belongings& before, const std::set<std::string>& names,
                           Hands& hands)
{
    for (auto waited = std::chrono::milliseconds(0);
         waited <= kSettlingTime &&
         (!AreSettled(record, names) || !IsReplaced(ends.standby, HostView::Now()));
         waited += kBetweenGlances) {
        std::this_thread::sleep_for(kBetweenGlances);
    }
    Belongings missing = WaitFor(before, names);
    TieUp(ends, HostView::Now(), hands);
    return missing;
}

Answer FailedFor(const std::string& reason, Json fields)
{
    return Failed(kDoesNotHold, reason, std::move(fields));
}

/** What the library has on the switch is for the library to bring home first. */
std::string SwitchObstacle(const HostView& host, const std::set<std::string>& names)
{
    std::string carried;
    for (const std::string& name : names) {
        if (host.live.Find(BridgeOf(name)) != nullptr) {
            carried += (carried.empty() ? "" : ", ") + name;
        }
    }
    const auto clients = ReadClients();
    if (carried.empty() && clients && clients->empty()) {
        return "";
    }
    if (!clients) {
        return "the registrations cannot be read.";
    }
    return (carried.empty() ? "clients are registered"
                            : carried + (clients->empty() ? " is on the switch"
                                                          : " is on the switch for clients")) +
           (clients->empty() ? "" : ": " + List(*clients)) +
           ".\nBring the host home first: 'vornovsctl unregister NAME' for each of them.";
}

/** A change of hands that was cut short is brought to its end in the direction that is asked for.
 */
class Adopting {
public:
    Adopting(const Context& context, Hands& hands) : m_context(context), m_hands(hands) {}

    Answer Run()
    {
        m_record = AdoptionRecord::Load(m_hands).value_or(AdoptionRecord());
        m_unfinished = m_record.NamesIn({Phase::kAdopting, Phase::kReleasing});
        ReadNew();
        m_names = m_unfinished;
        for (const auto& [name, wish] : m_wishes) {
            m_names.insert(name);
        }
        if (m_names.empty()) {
            return Failed(kNothingToDo, NothingText(), Fields(false));
        }
        if (const std::string obstacles = ObstaclesText(m_wishes); !obstacles.empty()) {
            return FailedFor(obstacles + "\nNothing was changed.", Fields(false));
        }
        if (const std::string obstacle = SwitchObstacle(m_host, m_names); !obstacle.empty()) {
            return FailedFor(obstacle + "\nNothing was changed.", Fields(false));
        }
        AddToRecord(m_host, m_hands, m_wishes, m_record);
        if (m_context.arguments.dryRun) {
            return Done(AdoptionText(m_wishes, m_record) + UnfinishedText(), Fields(false));
        }
        m_context.tell(AdoptionText(m_wishes, m_record) + UnfinishedText());
        return Perform();
    }

private:
    void ReadNew()
    {
        const std::set<std::string> asked = NamesOf(m_context);
        std::set<std::string> adopted =
            m_record.NamesIn({Phase::kAdopting, Phase::kAdopted, Phase::kReleasing});
        std::set<std::string> open;
        std::set_difference(asked.begin(), asked.end(), adopted.begin(), adopted.end(),
                            std::inserter(open, open.end()));
        if (!asked.empty() && open.empty()) {
            return;
        }
        m_wishes = ReadWishes(m_host, open);
        std::erase_if(m_wishes, [&](const auto& each) { return adopted.contains(each.first); });
    }

    std::string NothingText() const
    {
        return m_record.interfaces.empty()
                   ? "there is no wired interface that somebody manages."
                   : "adopted already: " + List(m_record.NamesIn({Phase::kAdopted})) + '.';
    }

    std::string UnfinishedText() const
    {
        return m_unfinished.empty() ? ""
                                    : "Finishes what was cut short: " + List(m_unfinished) + '\n';
    }

    Json Fields(bool done) const
    {
        Json fields = AdoptionFields(m_wishes, m_record, done);
        fields["finished"] = m_unfinished;
        return fields;
    }

    Answer Perform()
    {
        const Belongings before = BelongingsOf(m_host, m_names);
        std::string failure;
        try {
            PerformAdoption(m_host, m_names, m_record, m_hands);
            const Belongings missing = WaitFor(before, m_names);
            failure = missing.empty() ? "" : "missing afterwards: " + List(missing);
        } catch (const std::exception& error) {
            failure = error.what();
        }
        if (!failure.empty()) {
            return Undo(failure, before);
        }
        for (AdoptedInterface& interface : m_record.interfaces) {
            interface.phase = Phase::kAdopted;
        }
        m_record.Save(m_hands);
        return Done("Adopted: " + List(m_names) + ".\n", Fields(true));
    }

    Answer Undo(const std::string& failure, const Belongings& before)
    {
        const std::string text = failure + ".\n";
        const AdoptionRecord whole = m_record;
        LooseEnds ends;
        try {
            ends = PerformRelease(HostView::Now(), m_names, m_record, m_hands);
        } catch (const std::exception& error) {
            return Failed(kOutOfStep,
                          text + "It could not be undone: " + error.what() +
                              ".\nRun 'vornovsctl release' when that is mended.",
                          Fields(false));
        }
        const Belongings missing = WaitForManagers(whole, ends, before, m_names, m_hands);
        return FailedFor(
            text + "It was undone" +
                (missing.empty() ? "." : ", but still missing: " + List(missing) + '.'),
            Fields(false));
    }

    const Context& m_context;
    Hands& m_hands;
    HostView m_host = HostView::Now();
    AdoptionRecord m_record;
    std::set<std::string> m_unfinished;
    std::set<std::string> m_names;
    Wishes m_wishes;
};

Answer ReleaseAll(const Context& context, Hands& hands)
{
    auto record = AdoptionRecord::Load(hands);
    const std::set<std::string> asked = NamesOf(context);
    const HostView host = HostView::Now();
    std::set<std::string> names = asked.empty() ? std::set<std::string>() : asked;
    if (record && !asked.empty()) {
        names = WithTheirGroups(host, names);
        // One that was cut short goes on whatever is asked for.
        names.merge(record->NamesIn({Phase::kReleasing}));
    }
    std::erase_if(
        names, [&](const std::string& name) { return !record || record->Find(name) == nullptr; });
    if (record && asked.empty()) {
        names = record->NamesIn({Phase::kAdopting, Phase::kAdopted, Phase::kReleasing});
    }
    if (!record || names.empty()) {
        return Failed(kNothingToDo,
                      asked.empty() ? "no interface is adopted."
                                    : "not adopted: " + List(asked) + '.',
                      ReleaseFields(record.value_or(AdoptionRecord()), names, false));
    }
    if (const std::string obstacle = SwitchObstacle(host, names); !obstacle.empty()) {
        return FailedFor(obstacle + "\nNothing was changed.", ReleaseFields(*record, names, false));
    }
    const Json plan = ReleaseFields(*record, names, !context.arguments.dryRun);
    if (context.arguments.dryRun) {
        return Done(ReleaseText(*record, names), plan);
    }
    context.tell(ReleaseText(*record, names));
    const Belongings before = BelongingsOf(host, names);
    const AdoptionRecord whole = *record;
    LooseEnds ends;
    try {
        ends = PerformRelease(host, names, *record, hands);
    } catch (const std::exception& error) {
        return Failed(kOutOfStep,
                      error.what() + std::string(".\nRun 'vornovsctl release' again when that is "
                                                 "mended."),
                      ReleaseFields(*record, names, false));
    }
    const Belongings missing = WaitForManagers(whole, ends, before, names, hands);
    if (!missing.empty()) {
        return FailedFor(
            "released, but missing since: " + List(missing) + ".\nSee the manager's log.", plan);
    }
    return Done("Released: " + List(names) + ".\n", plan);
}

template <typename Act>
Answer WithLock(const Act& act)
{
    const vornhost::Descriptor lock =
        vornhost::TakeRunLock(kLockName, vornhost::LockDeadlineIn(kLockSeconds));
    return lock ? act() : FailedFor("another 'vornovsctl' is about the same.", Json::object());
}

} // namespace

Answer Adopt(const Context& context)
{
    return WithLock([&] {
        Hands hands;
        return Adopting(context, hands).Run();
    });
}

Answer Release(const Context& context)
{
    return WithLock([&] {
        Hands hands;
        return ReleaseAll(context, hands);
    });
}

} // namespace vornovsctl
