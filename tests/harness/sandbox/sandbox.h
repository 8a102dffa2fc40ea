/**
 * A private view of the machine for a test binary. The paths that the code under test uses are
 * real, their contents are the test's own, and nothing of it reaches the machine.
 */
#ifndef VORNOVS_TESTS_HARNESS_SANDBOX_H
#define VORNOVS_TESTS_HARNESS_SANDBOX_H

#include <string>
#include <vector>

namespace harness {

struct SandboxOptions {
    /** A network of its own: nothing but "lo", which is up; /sys shows that network. */
    bool network = false;
    /**
     * Further folders, such as "/usr/bin", into which the tests put files or replace some. They
     * keep their entries; what is made there is private.
     */
    std::vector<std::string> writable;
};

/**
 * Moves the process into private namespaces of mounts and, when asked for, of the network. A
 * process without the privilege for that becomes root of a user namespace first.
 *
 * Inside, /usr/vorn, /etc/sysconfig, /etc/init.d, /run and /tmp exist and are empty; new entries
 * can be made in "/", /usr, /etc and /dev; /dev/log, /etc/rc.network, /etc/vorninfo.conf and
 * /etc/vornovs-host.conf do not exist. All else is the machine's. This project's source and build
 * folders stay where they are, below /tmp too.
 *
 * To be called before the process has a second thread. Throws std::runtime_error, whose text says
 * which step failed and why.
 */
void EnterSandbox(const SandboxOptions& options = {});

} // namespace harness

#endif
