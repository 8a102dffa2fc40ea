/**
 * Calls of programs that would do something else than the client means.
 */
#ifndef VORNHOST_CORE_REFUSAL_H
#define VORNHOST_CORE_REFUSAL_H

#include <string>
#include <vector>

namespace vornhost {

/**
 * Looks at a program's arguments, its path first. To the switch's tool "--" begins another command
 * and is no name. A copy goes from file to file: into a folder it would get another name, into a
 * device it would be lost, and a FIFO would hold it up for as long as nobody is at its other end.
 * @return  why the program is not to be run; empty: it may be.
 */
std::string RefusalOf(const std::vector<std::string>& argv);

/** The same; logs the reason. @return  whether it is refused. */
bool IsRefused(const std::vector<std::string>& argv);

} // namespace vornhost

#endif
