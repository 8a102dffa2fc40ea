/**
 * The configuration files of several interfaces and their gateway records, read at one moment and
 * brought back to what they were at another.
 */
#ifndef VORNHOST_SUPPORT_FILESTATES_H
#define VORNHOST_SUPPORT_FILESTATES_H

#include "keyvaluefile.h"
#include "remembered.h"

#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace vornhost {

/** @return  nothing when there is a file that cannot be read (errno says why). */
std::optional<FileState> ReadFileState(const std::string& interface);

/** @return  nothing when one of the files cannot be read. */
std::optional<FileStates> ReadFileStates(const std::vector<std::string>& interfaces);

/**
 * Brings one interface's file to a state; a file that is in it already is not touched.
 * @return  false: it is as it was (errno says why).
 */
bool WriteFileState(const std::string& interface, const FileState& state);

/**
 * Brings files to a state in the given order, which decides what a host does that is restarted in
 * between. Stops at the first that cannot be written.
 * @return  false: one could not be written; the system log says which and why.
 */
bool WriteFileStates(const std::vector<std::string>& order, const FileStates& states);

/** @return  the file of the state, empty when there is none. */
KeyValueFile FileOf(const FileStates& states, const std::string& interface);

/** @return  both families' gateway records of the interfaces; nothing when they cannot be read. */
std::optional<std::vector<GatewayState>>
ReadGatewayStates(const std::vector<std::string>& interfaces);

/** Brings gateway records to a state. @return  false: they are as they were (errno says why). */
bool WriteGatewayStates(const std::vector<GatewayState>& states);

} // namespace vornhost

#endif
