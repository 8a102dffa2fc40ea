#include "routers.h"

#include "announce.h"

#include "support/netlink.h"

#include <algorithm>
#include <chrono>
#include <set>
#include <thread>

#include <linux/rtnetlink.h>
#include <net/if.h>
#include <sys/socket.h>

namespace vornhost {
namespace {

// A router answers within half a second, and not more often than every three to everybody.
constexpr std::chrono::seconds kRouterPatience{4};
constexpr std::chrono::seconds kBetweenQuestions{1};
constexpr std::chrono::milliseconds kBetweenGlances{20};

bool IsMade(const RouterRoute& wanted, const std::vector<Route>& routes)
{
    const int index = static_cast<int>(if_nametoindex(wanted.interface.c_str()));
    return std::any_of(routes.begin(), routes.end(), [&](const Route& route) {
        return route.family == AF_INET6 && route.protocol == RTPROT_RA && route.prefixLength == 0 &&
               route.priority == wanted.metric && route.nextHops.size() == 1 &&
               route.nextHops.front().index == index &&
               route.nextHops.front().gateway == wanted.gateway;
    });
}

void Ask(const std::vector<RouterRoute>& routes, const std::vector<Route>& live)
{
    std::set<std::string> interfaces;
    for (const RouterRoute& route : routes) {
        if (!IsMade(route, live) && interfaces.insert(route.interface).second) {
            (void)SolicitRouters(route.interface);
        }
    }
}

} // namespace

std::vector<RouterRoute> HearRouters(std::vector<RouterRoute> routes)
{
    const auto begin = std::chrono::steady_clock::now();
    auto question = begin;
    std::vector<Route> live;
    for (auto now = begin; now < begin + kRouterPatience; now = std::chrono::steady_clock::now()) {
        live = ReadRoutes().value_or(std::vector<Route>());
        if (std::all_of(routes.begin(), routes.end(),
                        [&](const RouterRoute& route) { return IsMade(route, live); })) {
            break;
        }
        if (now >= question) {
            Ask(routes, live);
            question = now + kBetweenQuestions;
        }
        std::this_thread::sleep_for(kBetweenGlances);
    }
    std::erase_if(routes, [&](const RouterRoute& route) { return !IsMade(route, live); });
    return routes;
}

} // namespace vornhost
