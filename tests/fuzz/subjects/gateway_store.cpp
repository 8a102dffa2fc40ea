/**
 * The records of gateways. The text is orders, a line of its own with a dot, and the file's text.
 */
#include "subject.h"
#include "text.h"

#include "support/gatewaystore.h"
#include "support/interfacename.h"
#include "support/interfacevalues.h"

#include <sys/socket.h>

namespace {

using fuzz::Expect;
using vornhost::AddressFamily;
using vornhost::Gateway;
using vornhost::GatewayRecord;
using vornhost::GatewayStore;

constexpr char kFolder[] = "/usr/vorn/etc/vornnetd";

AddressFamily FamilyOf(const std::string& word)
{
    return word == "inet6" ? AddressFamily::kIPv6 : AddressFamily::kIPv4;
}

int NumberOf(AddressFamily family)
{
    return family == AddressFamily::kIPv6 ? AF_INET6 : AF_INET;
}

/** The lines of a text that are no record. */
std::vector<std::string> Others(const std::string& text)
{
    std::vector<std::string> others;
    for (const std::string& line : fuzz::LinesOf(text)) {
        const std::string content = line.ends_with('\n') ? line.substr(0, line.size() - 1) : line;
        if (GatewayStore::Parse(content).Records().empty()) {
            others.push_back(content);
        }
    }
    return others;
}

void CheckRecords(const GatewayStore& store)
{
    for (const GatewayRecord& record : store.Records()) {
        Expect(vornhost::IsInterfaceName(record.interface), "a record is of no interface");
        Expect(vornhost::NormalAddress(NumberOf(record.family), record.gateway.address) ==
                   record.gateway.address,
               "a gateway's address is none, or not as it is usually written");
        Expect(store.Find(record.interface, record.family) == record.gateway,
               "another record counts than is listed");
    }
}

void CheckSet(GatewayStore store, const std::vector<std::string>& order)
{
    const AddressFamily family = FamilyOf(order[2]);
    const auto former = store.Find(order[1], family);
    const std::string before = store.Text();
    const Gateway gateway{order[3], vornhost::ToNumber(order[4], 0, UINT32_MAX)};
    if (!store.Set(order[1], family, gateway)) {
        Expect(store.Text() == before, "a gateway that was refused changed the records");
        return;
    }
    const auto found = store.Find(order[1], family);
    Expect(found && found->metric == gateway.metric &&
               found->address == vornhost::NormalGatewayAddress(family, order[3]),
           "another gateway is there than was set");
    Expect(Others(store.Text()) == Others(before), "setting a record changed another line");
    Expect(store.Remove(order[1], family), "what was set cannot be removed");
    Expect(former || store.Text() == before, "setting and removing a new record changed the rest");
}

void CheckCopy(GatewayStore store, const std::vector<std::string>& order)
{
    const AddressFamily family = FamilyOf(order[3]);
    const auto source = store.Find(order[1], family);
    if (store.Copy(order[1], order[2], family)) {
        Expect(store.Find(order[2], family) == source, "a copy is not what was copied");
    }
}

/** On disk it is what it is in memory, and nothing stands beside it. */
void CheckSave(GatewayStore store, std::string_view text, const std::string& removed)
{
    const std::string path = vornhost::kGatewayStorePath;
    fuzz::MakeEmptyFolder(kFolder);
    fuzz::WriteFile(path, text);
    (void)store.Remove(removed, AddressFamily::kIPv4);
    Expect(store.Save(path), "the records cannot be written");
    const auto again = GatewayStore::Load(path);
    Expect(again && again->Records() == store.Records(), "other records are on disk");
    const std::string written = store.Text();
    Expect(fuzz::ReadFile(path) == written, "another text is on disk");
    Expect(fuzz::EntriesOf(kFolder).size() <= 1, "something stands beside the records");
}

void Run(std::string_view text)
{
    const std::string orders = fuzz::TakeUpTo("\n.\n", text);
    const GatewayStore store = GatewayStore::Parse(text);
    Expect(store.Text() == text, "reading the records changed them");
    CheckRecords(store);
    constexpr int kMostOrders = 6;
    int left = kMostOrders;
    for (const std::string& line : fuzz::LinesOf(orders)) {
        const auto order = fuzz::Order(fuzz::Content(line), 5);
        if (left-- == 0) {
            break;
        }
        if (order[0] == "set") {
            CheckSet(store, order);
        } else if (order[0] == "copy") {
            CheckCopy(store, order);
        } else {
            CheckSave(store, text, order[1]);
        }
    }
}

const fuzz::Subject kSubject("gateway_store", Run);

} // namespace
