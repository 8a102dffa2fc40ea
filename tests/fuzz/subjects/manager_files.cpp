/**
 * What other managers of the network leave: sections of systemd-networkd, leases of a DHCP client,
 * and our own record of what was taken over from them. The text begins with a word for which.
 */
#include "subject.h"
#include "text.h"

#include <adopt/adoptionrecord.h>
#include <adopt/dhclient.h>
#include <adopt/lease.h>
#include <adopt/networkdsections.h>

#include <map>

namespace {

using fuzz::Expect;

constexpr char kMac[] = "02:00:00:00:00:01";
constexpr std::size_t kShortestAnswer = 240;

/** A key's last value is the one that counts. */
void CheckSection(const vornovsctl::IniSection& section)
{
    std::map<std::string, std::string> last;
    for (const auto& [key, value] : section.keys) {
        Expect(key.find('\n') == std::string::npos && value.find('\n') == std::string::npos,
               "a key or its value has several lines");
        last[key] = value;
    }
    for (const auto& [key, value] : last) {
        Expect(section.Get(key) == value, "another value of a key counts than its last one");
    }
}

void FeedSections(const std::string& text)
{
    vornovsctl::Wish wish;
    for (const auto& section : vornovsctl::ParseIni(text)) {
        CheckSection(section);
        vornovsctl::TakeNetworkdSection(section, "/etc/systemd/network/eth0.network", wish);
    }
}

void FeedLeases(const std::string& text)
{
    const vornovsctl::DhclientState state = vornovsctl::ParseDhclientLeases(text, "eth0");
    const auto identity = vornovsctl::DhclientIdentity({"-i"}, text, state.duid, kMac);
    Expect(identity.clientId.has_value(), "the client has no identity");
    if (!state.lease) {
        return;
    }
    Expect(!state.lease->address.empty(), "a lease is of no address");
    const auto answer = vornovsctl::AnswerOf(*state.lease, kMac);
    Expect(!answer || answer->size() >= kShortestAnswer, "an answer is too short to be one");
    const vornovsctl::Lease6 lease{state.lease->address, state.duid, state.iaid, 1, 2};
    (void)vornovsctl::AnswerOf6(lease);
}

/** Read, written and read again it is the same. */
void FeedRecord(const std::string& text)
{
    constexpr char kPath[] = "/usr/vorn/etc/vornnetd/adopted/record.json";
    vornovsctl::Hands hands;
    fuzz::MakeEmptyFolder(vornovsctl::kAdoptedFolder);
    fuzz::WriteFile(kPath, text);
    std::optional<vornovsctl::AdoptionRecord> record;
    try {
        record = vornovsctl::AdoptionRecord::Load(hands);
    } catch (const std::runtime_error&) {
        return; // it says that it cannot be read
    }
    Expect(record.has_value(), "the record is not there");
    record->Save(hands);
    Expect(vornovsctl::AdoptionRecord::Load(hands) == record, "a record was written as another");
}

void Run(std::string_view text)
{
    const std::string kind = fuzz::TakeUpTo("\n", text);
    const std::string rest(text);
    if (kind == "networkd") {
        FeedSections(rest);
    } else if (kind == "record") {
        FeedRecord(rest);
    } else {
        FeedLeases(rest);
    }
}

const fuzz::Subject kSubject("manager_files", Run);

} // namespace
