/**
 * What a command line asks of the gateway tool.
 */
#ifndef VORNHOST_NETDTOOL_REQUEST_H
#define VORNHOST_NETDTOOL_REQUEST_H

#include "support/gatewaystore.h"

#include <optional>
#include <string>

namespace vornhost {

enum class GatewayAction { kCopy, kRemove, kSet, kList };

struct GatewayRequest {
    GatewayAction action = GatewayAction::kList;
    std::optional<AddressFamily> family; /**< none: both, when listing */
    std::string interface;               /**< the copy's source */
    std::string target;                  /**< the copy's */
    Gateway gateway;                     /**< to set */
    bool json = false;                   /**< list as JSON */
};

/** The request, or what is left to print and exit with. */
struct ParsedRequest {
    std::optional<GatewayRequest> request;
    std::string output; /**< help or version, for standard output */
    std::string error;  /**< what is wrong with the command line */
};

ParsedRequest ParseRequest(int argc, const char* const argv[]);

} // namespace vornhost

#endif
