/**
 * vornnetdtool: edits and lists the gateway records of the host.
 */
#include "request.h"

#include "support/gatewaystore.h"

#include <cerrno>
#include <cstring>
#include <exception>
#include <iostream>
#include <nlohmann/json.hpp>
#include <syslog.h>

namespace {

using vornhost::AddressFamily;
using vornhost::GatewayAction;
using vornhost::GatewayRecord;
using vornhost::GatewayRequest;
using vornhost::GatewayStore;

constexpr int kDone = 0;
constexpr int kFailed = 1;
constexpr int kUsage = 2;

// The tool mostly runs for the library, whose own message does not tell the reason.
int Fail(const std::string& message)
{
    std::cerr << "vornnetdtool: " << message << '\n';
    ::syslog(LOG_ERR, "vornnetdtool: %s", message.c_str());
    return kFailed;
}

int FailWithReason(const std::string& message)
{
    return Fail(message + ": " + std::strerror(errno));
}

void PrintText(const std::vector<GatewayRecord>& records)
{
    for (const auto& [interface, family, gateway] : records) {
        std::cout << interface << (family == AddressFamily::kIPv4 ? " inet " : " inet6 ")
                  << gateway.address;
        if (gateway.metric) {
            std::cout << " metric " << *gateway.metric;
        }
        std::cout << '\n';
    }
}

void PrintJson(const std::vector<GatewayRecord>& records)
{
    auto list = nlohmann::ordered_json::array();
    for (const auto& [interface, family, gateway] : records) {
        nlohmann::ordered_json entry = {{"interface", interface},
                                        {"family", family == AddressFamily::kIPv4 ? 4 : 6},
                                        {"gateway", gateway.address}};
        if (gateway.metric) {
            entry["metric"] = *gateway.metric;
        }
        list.push_back(entry);
    }
    std::cout << list.dump(2) << '\n';
}

int List(const GatewayRequest& request)
{
    const auto store = GatewayStore::Load();
    if (!store) {
        return FailWithReason(std::string("cannot read ") + vornhost::kGatewayStorePath);
    }

    auto records = store->Records();
    std::erase_if(records, [&](const GatewayRecord& record) {
        return request.family && record.family != *request.family;
    });
    if (request.json) {
        PrintJson(records);
    } else {
        PrintText(records);
    }
    return std::cout.flush() ? kDone : Fail("cannot write the list");
}

int Edit(const GatewayRequest& request)
{
    const vornhost::GatewayStoreLock lock;
    if (!lock.Held()) {
        return FailWithReason("cannot lock the gateway records");
    }
    auto store = GatewayStore::Load();
    if (!store) {
        return FailWithReason(std::string("cannot read ") + vornhost::kGatewayStorePath);
    }

    // The names and the address have been checked: the store takes them.
    if (request.action == GatewayAction::kCopy) {
        (void)store->Copy(request.interface, request.target, *request.family);
    } else if (request.action == GatewayAction::kSet) {
        (void)store->Set(request.interface, *request.family, request.gateway);
    } else {
        (void)store->Remove(request.interface, *request.family);
    }
    return store->Save()
               ? kDone
               : FailWithReason(std::string("cannot write ") + vornhost::kGatewayStorePath);
}

int Run(int argc, const char* const argv[])
{
    const auto parsed = vornhost::ParseRequest(argc, argv);
    if (parsed.request) {
        return parsed.request->action == GatewayAction::kList ? List(*parsed.request)
                                                              : Edit(*parsed.request);
    }
    if (parsed.error.empty()) {
        std::cout << parsed.output;
        return kDone;
    }
    std::cerr << "vornnetdtool: " << parsed.error << "\nTry 'vornnetdtool --help'.\n";
    return kUsage;
}

} // namespace

int main(int argc, char* argv[])
{
    try {
        return Run(argc, argv);
    } catch (const std::exception& error) {
        return Fail(error.what());
    }
}
