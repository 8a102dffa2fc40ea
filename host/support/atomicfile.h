/**
 * Files that a reader finds whole: as they were or as they are, never half written.
 */
#ifndef VORNHOST_SUPPORT_ATOMICFILE_H
#define VORNHOST_SUPPORT_ATOMICFILE_H

#include <string>

#include <sys/types.h>

namespace vornhost {

/** The mode of files that only root reads: they may hold secrets, or nobody else needs them. */
constexpr mode_t kPrivateFile = 0600;

/**
 * Gives a file a new content, or makes it. An existing one keeps its owner, group and mode; behind
 * a symbolic link the file that it points at is replaced and the link stays. The file gets a new
 * inode, so another hard link to it keeps the old content.
 * @param modeForNew  exact mode of a file that is made; the process's mask does not count.
 * @return  true: the content is on the disk; false: the file is as it was and errno says why (a
 *          dangling link, or something that is no regular file, is left alone).
 */
bool ReplaceFile(const std::string& path, const std::string& text, mode_t modeForNew);

} // namespace vornhost

#endif
