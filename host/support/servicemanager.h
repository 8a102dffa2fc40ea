/**
 * systemd, asked over its own socket, which answers root from the first moment of a boot and needs
 * no message bus.
 */
#ifndef VORNHOST_SUPPORT_SERVICEMANAGER_H
#define VORNHOST_SUPPORT_SERVICEMANAGER_H

#include <chrono>
#include <optional>
#include <string>

#include <sys/stat.h>

namespace vornhost {

/** @return  whether systemd is what started this host; asks nobody. */
inline bool SystemdRuns()
{
    struct stat status {};
    return ::lstat("/run/systemd/system", &status) == 0 && S_ISDIR(status.st_mode);
}

/**
 * Has a unit started, stopped or started anew, and waits until systemd is done with that. A unit
 * that is so already is left alone by the first two.
 * @param unit      its whole name, such as "vornovs-db.service".
 * @param deadline  how long to wait; systemd goes on with the work afterwards.
 * @param error     receives why it failed; may be null.
 * @return  false when it failed, did not end in time or systemd does not answer.
 */
bool StartUnit(const std::string& unit, std::chrono::milliseconds deadline,
               std::string* error = nullptr);
bool StopUnit(const std::string& unit, std::chrono::milliseconds deadline,
              std::string* error = nullptr);
bool RestartUnit(const std::string& unit, std::chrono::milliseconds deadline,
                 std::string* error = nullptr);

/** @return  whether the unit is active; nullopt when systemd does not answer. */
std::optional<bool> UnitIsActive(const std::string& unit);

/** @return  whether systemd has such a unit; nullopt when it does not answer. */
std::optional<bool> UnitExists(const std::string& unit);

} // namespace vornhost

#endif
