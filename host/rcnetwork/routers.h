/**
 * Routers that the kernel hears, on interfaces that routes were carried to.
 */
#ifndef VORNHOST_RCNETWORK_ROUTERS_H
#define VORNHOST_RCNETWORK_ROUTERS_H

#include <cstdint>
#include <string>
#include <vector>

namespace vornhost {

/** A default route as the kernel makes it; one with the next metric stands in for it. */
struct RouterRoute {
    std::string interface;
    std::uint32_t metric = 0;
    std::string gateway;
};

/**
 * Has routers tell of themselves, and waits for the kernel to make its routes.
 * @return  those that it has made; the others may come later.
 */
std::vector<RouterRoute> HearRouters(std::vector<RouterRoute> routes);

} // namespace vornhost

#endif
