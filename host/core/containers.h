/**
 * What stands behind the platform's containers.
 */
#ifndef VORNHOST_CORE_CONTAINERS_H
#define VORNHOST_CORE_CONTAINERS_H

#include <string>
#include <utility>
#include <vector>

#include <vornplatform/core.h>

/** Key and value pairs in the order in which the keys came. */
struct VLIBCSzHash {
    std::vector<std::pair<std::string, std::string>> entries;
    /** An insert failed: what is there is not what the client believes to be there. */
    bool incomplete = false;
};

namespace vornhost {

/** A list whose first member is what clients see of it. */
struct StringList {
    VLIBCSzList head{0};
    std::vector<std::string> items;
};

} // namespace vornhost

#endif
