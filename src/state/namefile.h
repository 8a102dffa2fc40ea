#ifndef VORNOVS_STATE_NAMEFILE_H
#define VORNOVS_STATE_NAMEFILE_H

#include <set>
#include <string>

namespace VORN::OVS {

constexpr char kStateFolder[] = "/usr/vorn/etc/vornovs";
constexpr unsigned int kStateFolderMode = 0755;

/** Makes the state folder when it is missing. @return whether it exists now. */
bool MakeStateFolder();

/**
 * Adds every line of the file to the names, exactly as it stands; the last one needs no line end.
 * @return false: the file cannot be opened.
 */
bool ReadNames(const std::string& path, std::set<std::string>& names);

/**
 * Makes the file hold the names, one a line, or removes it when there are none. A regular file is
 * replaced as a whole and keeps owner and mode: a reader sees the old names or the new ones, and so
 * does whoever comes after a crash. Anything else is written in place.
 * @return false: the file cannot be opened for writing. A later write error leaves the old file
 *         and counts as success.
 */
bool WriteNames(const std::string& path, const std::set<std::string>& names);

} // namespace VORN::OVS

#endif
