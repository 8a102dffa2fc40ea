/**
 * Runs of this program that belong to nobody: they go on when the one who asked for them, and
 * everything that belongs to it, is ended.
 */
#ifndef VORNHOST_RCNETWORK_ALONE_H
#define VORNHOST_RCNETWORK_ALONE_H

#include <string>
#include <vector>

namespace vornhost {

/**
 * Has a unit of systemd run this program. Where systemd does not run, or does not do so, this
 * program is started as nobody's child.
 * @param unit       the unit that runs it with these arguments.
 * @param arguments  without the program's name.
 * @return  false when it was not started (errno says why).
 */
bool StartAlone(const std::string& unit, const std::vector<std::string>& arguments);

} // namespace vornhost

#endif
