/**
 * The edits of key=value files as the platform's contract words them, carried out on real files,
 * for tests that look at the file that results.
 */
#ifndef HARNESS_KEYVALUEMODEL_H
#define HARNESS_KEYVALUEMODEL_H

#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace harness {

using KeyValues = std::vector<std::pair<std::string, std::string>>;

/** Copies a file's content; false: it cannot be read or written. */
bool CopyFile(const std::string& source, const std::string& target);

/** Replaces or appends the set keys, deletes the removed ones; false: cannot be written. */
bool EditFile(const std::string& path, const KeyValues& set, const KeyValues& remove);

/** The key's value without enclosing double quotes; nothing: no file or no such key. */
std::optional<std::string> ReadKey(const std::string& path, const std::string& key);

} // namespace harness

#endif
