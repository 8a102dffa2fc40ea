/**
 * The lock file that clients name, "/tmp/ovs_config.lock". Its folder is one where everybody can
 * make files, and where cleaners remove them.
 */
#ifndef VORNHOST_CORE_CONTRACTFILE_H
#define VORNHOST_CORE_CONTRACTFILE_H

#include "support/runlock.h"

#include <string>

namespace vornhost {

/** What became of an attempt to lock the file. */
struct ContractLock {
    enum class Outcome {
        kTaken,      /**< the file is locked */
        kHeld,       /**< somebody else held it until the deadline */
        kImpossible, /**< there is no such file, and none can be made */
    };
    Outcome outcome = Outcome::kImpossible;
    Descriptor file;
};

/**
 * Locks a regular file of ours that nobody else can open, and makes it when missing. In a folder
 * where others can write, anything else that stands in its place is removed and logged: it may
 * have been put there to keep us out, and a lock on it would be worth nothing.
 */
ContractLock LockContractFile(const std::string& path, LockDeadline deadline);

} // namespace vornhost

#endif
