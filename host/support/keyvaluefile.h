/**
 * A file of "key=value" lines, kept byte for byte but for what is edited.
 *
 * A line's key is what stands before its first "="; blanks before the key do not belong to it. A
 * line that begins with "#", has no "=" or no key is not looked at. A value is what follows, to the
 * end of the line; one that stands between double quotes is handed out without them. Lines end with
 * LF or CR LF. Of several lines of one key the last one counts, as it does for a shell that reads
 * the file.
 */
#ifndef VORNHOST_SUPPORT_KEYVALUEFILE_H
#define VORNHOST_SUPPORT_KEYVALUEFILE_H

#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace vornhost {

class KeyValueFile {
public:
    /** @return nothing when the file cannot be read or is no regular file; errno says why. */
    static std::optional<KeyValueFile> Load(const std::string& path);

    static KeyValueFile Parse(std::string text);

    /** @return the key's value, nothing when no line has the key. */
    std::optional<std::string> Get(std::string_view key) const;

    /** @return the key's value as it is written, with its quotes; nothing when there is none. */
    std::optional<std::string> GetWritten(std::string_view key) const;

    /** @return every key once, in the file's order. */
    std::vector<std::string> Keys() const;

    /** @return  every key's value, as Get() answers it. */
    std::map<std::string, std::string> Values() const;

    /** @return  every key's value, as GetWritten() answers it. */
    std::map<std::string, std::string> WrittenValues() const;

    /**
     * Makes a key present exactly once: its first line is replaced, where the administrator put it
     * and its comment; further ones go. A new key is appended.
     * @return false, and nothing is changed: the key or the value cannot stand in such a line.
     */
    bool Set(std::string_view key, std::string_view value);

    /** Deletes every line of a key. @return whether there was one. */
    bool Remove(std::string_view key);

    /** The whole file as it is now. Ends without a line break if it did so before. */
    const std::string& Text() const { return m_text; }

    /** @return whether a line can have that key: not empty, no blanks, "=", "#" first, controls. */
    static bool IsKey(std::string_view key);

    /** @return whether a line can have that value: no line break and no NUL. */
    static bool IsValue(std::string_view value);

private:
    /** Where a line stands in the text; its end includes the line break. */
    struct Line {
        size_t begin;
        size_t end;
    };

    std::vector<Line> Lines() const;
    std::vector<Line> LinesOf(std::string_view key) const;
    std::string_view TextOf(const Line& line) const;
    void Erase(const Line& line);
    void Append(const std::string& line);
    size_t LastLine() const;

    std::string m_text;
};

} // namespace vornhost

#endif
