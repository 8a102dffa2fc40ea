#include "adopt/wish.h"

namespace vornovsctl {

const char* NameOf(Manager manager)
{
    switch (manager) {
    case Manager::kIfupdown:
        return "ifupdown";
    case Manager::kNetworkd:
        return "systemd-networkd";
    case Manager::kNetworkManager:
        return "NetworkManager";
    case Manager::kNobody:
        break;
    }
    return "nobody";
}

} // namespace vornovsctl
