#include "keyvaluefile.h"

#include "descriptor.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <set>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace vornhost {
namespace {

constexpr std::string_view kBlanks = " \t";

/** The line's content, without its line break. */
std::string_view Content(std::string_view line)
{
    if (line.ends_with('\n')) {
        line.remove_suffix(1);
    }
    if (line.ends_with('\r')) {
        line.remove_suffix(1);
    }
    return line;
}

/** What a line breaks with: LF, CR LF, or, at the end of the file, CR or nothing. */
std::string_view LineBreak(std::string_view line)
{
    return line.substr(Content(line).size());
}

/** @return the key of a line, empty when it has none. */
std::string_view KeyOf(std::string_view line)
{
    const size_t begin = line.find_first_not_of(kBlanks);
    const size_t equals = line.find('=');
    if (begin == std::string_view::npos || equals == std::string_view::npos || line[begin] == '#') {
        return {};
    }
    return line.substr(begin, equals - begin);
}

std::string_view WithoutQuotes(std::string_view value)
{
    const std::string_view quoted = value.substr(0, value.find_last_not_of(kBlanks) + 1);
    const bool isQuoted = quoted.size() >= 2 && quoted.front() == '"' && quoted.back() == '"';
    return isQuoted ? quoted.substr(1, quoted.size() - 2) : value;
}

} // namespace

std::optional<KeyValueFile> KeyValueFile::Load(const std::string& path)
{
    // Not to be held up by a FIFO in the file's place.
    const Descriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
    struct stat status {};
    if (!file || ::fstat(file.Get(), &status) != 0) {
        return std::nullopt;
    }
    if (!S_ISREG(status.st_mode)) {
        errno = S_ISDIR(status.st_mode) ? EISDIR : EINVAL;
        return std::nullopt;
    }

    std::string text;
    std::array<char, 16384> buffer{};
    for (;;) {
        const ssize_t size = ::read(file.Get(), buffer.data(), buffer.size());
        if (size == 0) {
            return Parse(std::move(text));
        }
        if (size > 0) {
            text.append(buffer.data(), static_cast<size_t>(size));
        } else if (errno != EINTR) {
            return std::nullopt;
        }
    }
}

KeyValueFile KeyValueFile::Parse(std::string text)
{
    KeyValueFile file;
    file.m_text = std::move(text);
    return file;
}

bool KeyValueFile::IsKey(std::string_view key)
{
    const auto isPlain = [](char letter) {
        return static_cast<unsigned char>(letter) > ' ' && letter != '=' && letter != '\x7f';
    };
    return !key.empty() && key.front() != '#' && std::all_of(key.begin(), key.end(), isPlain);
}

bool KeyValueFile::IsValue(std::string_view value)
{
    return value.find_first_of(std::string_view("\n\r\0", 3)) == std::string_view::npos;
}

std::optional<std::string> KeyValueFile::Get(std::string_view key) const
{
    const auto written = GetWritten(key);
    return written ? std::optional<std::string>(WithoutQuotes(*written)) : std::nullopt;
}

std::optional<std::string> KeyValueFile::GetWritten(std::string_view key) const
{
    const std::vector<Line> lines = LinesOf(key);
    if (lines.empty()) {
        return std::nullopt;
    }
    const std::string_view line = Content(TextOf(lines.back()));
    return std::string(line.substr(line.find('=') + 1));
}

std::vector<std::string> KeyValueFile::Keys() const
{
    std::vector<std::string> keys;
    std::set<std::string_view> seen;
    for (const Line& line : Lines()) {
        const std::string_view key = KeyOf(TextOf(line));
        if (!key.empty() && seen.insert(key).second) {
            keys.emplace_back(key);
        }
    }
    return keys;
}

std::map<std::string, std::string> KeyValueFile::Values() const
{
    std::map<std::string, std::string> values = WrittenValues();
    for (auto& [key, value] : values) {
        value = std::string(WithoutQuotes(value));
    }
    return values;
}

std::map<std::string, std::string> KeyValueFile::WrittenValues() const
{
    std::map<std::string, std::string> values;
    for (const Line& line : Lines()) {
        const std::string_view text = Content(TextOf(line));
        if (const std::string_view key = KeyOf(text); !key.empty()) {
            values[std::string(key)] = text.substr(text.find('=') + 1);
        }
    }
    return values;
}

bool KeyValueFile::Set(std::string_view key, std::string_view value)
{
    if (!IsKey(key) || !IsValue(value)) {
        return false;
    }
    const std::string content = std::string(key) + "=" + std::string(value);
    const std::vector<Line> lines = LinesOf(key);
    if (lines.empty()) {
        Append(content);
        return true;
    }

    KeyValueFile edited = *this;
    for (size_t index = lines.size() - 1; index > 0; --index) { // backwards: the others stay put
        edited.Erase(lines[index]);
    }
    const size_t begin = lines[0].begin;
    const size_t end = std::min(lines[0].end, edited.m_text.size());
    const size_t size = Content(std::string_view(edited.m_text).substr(begin, end - begin)).size();
    edited.m_text.replace(begin, size, content);
    m_text = std::move(edited.m_text);
    return true;
}

bool KeyValueFile::Remove(std::string_view key)
{
    const std::vector<Line> lines = LinesOf(key);
    for (size_t index = lines.size(); index > 0; --index) {
        Erase(lines[index - 1]);
    }
    return !lines.empty();
}

std::vector<KeyValueFile::Line> KeyValueFile::Lines() const
{
    std::vector<Line> lines;
    for (size_t begin = 0; begin < m_text.size();) {
        const size_t feed = m_text.find('\n', begin);
        const size_t end = feed == std::string::npos ? m_text.size() : feed + 1;
        lines.push_back({begin, end});
        begin = end;
    }
    return lines;
}

std::vector<KeyValueFile::Line> KeyValueFile::LinesOf(std::string_view key) const
{
    std::vector<Line> lines = Lines();
    std::erase_if(lines,
                  [&](const Line& line) { return key.empty() || KeyOf(TextOf(line)) != key; });
    return lines;
}

std::string_view KeyValueFile::TextOf(const Line& line) const
{
    return std::string_view(m_text).substr(line.begin, line.end - line.begin);
}

void KeyValueFile::Erase(const Line& line)
{
    const std::string_view text = m_text;
    const std::string ending(LineBreak(text.substr(line.begin, line.end - line.begin)));
    m_text.erase(line.begin, line.end - line.begin);
    if (line.begin != m_text.size() || m_text.empty() || ending.ends_with('\n')) {
        return;
    }
    // The file ended without a line break: what is its last line now does so too.
    const std::string_view last = std::string_view(m_text).substr(LastLine());
    const std::string keptBreak = ending.empty() || !last.ends_with("\r\n") ? "" : "\r";
    const std::string kept = std::string(Content(last)) + keptBreak;
    if (kept.empty() || Content(kept) != Content(last)) {
        return; // an empty line is nothing but its line break, and what ends like one needs it
    }
    m_text.resize(LastLine());
    m_text += kept;
}

void KeyValueFile::Append(const std::string& line)
{
    const std::string_view text = m_text;
    if (text.empty() || text.ends_with('\n')) {
        m_text += line + (text.ends_with("\r\n") ? "\r\n" : "\n");
        return;
    }
    const size_t last = LastLine();
    const std::string ending(LineBreak(text.substr(last)));
    const bool usesCarriageReturn = ending.empty() && text.substr(0, last).ends_with("\r\n");
    m_text += (usesCarriageReturn ? "\r\n" : "\n") + line + ending;
}

size_t KeyValueFile::LastLine() const
{
    const size_t feed =
        m_text.size() < 2 ? std::string::npos : m_text.rfind('\n', m_text.size() - 2);
    return feed == std::string::npos ? 0 : feed + 1;
}

} // namespace vornhost
