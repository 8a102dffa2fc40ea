/**
 * One question to the switch's database server.
 */
#ifndef VORNHOST_SUPPORT_DATABASECLIENT_H
#define VORNHOST_SUPPORT_DATABASECLIENT_H

#include <chrono>
#include <optional>
#include <string>
#include <string_view>

namespace vornhost {

/**
 * Sends a request to a server on a local socket and waits for the one message that it answers.
 * @return  nothing when the server cannot be reached or does not answer in time.
 */
std::optional<std::string> AskDatabase(const std::string& socketPath, std::string_view request,
                                       std::chrono::milliseconds limit);

} // namespace vornhost

#endif
