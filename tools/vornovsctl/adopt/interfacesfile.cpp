#include "adopt/interfacesfile.h"

#include <algorithm>
#include <array>
#include <filesystem>
#include <sstream>
#include <string_view>
#include <support/contains.h>
#include <support/interfacevalues.h>

namespace vornovsctl {

namespace {

constexpr std::string_view kAside = "#adopted# ";     // a line that comes back as it was
constexpr std::string_view kReplaced = "#replaced# "; // one after which its replacement stands

/** A line with those that continue it. */
struct LogicalLine {
    std::string raw;  /**< as it is written, with its line breaks */
    std::string text; /**< joined, without blanks at its ends */

    bool IsEmpty() const { return text.empty() || text.front() == '#'; }
};

std::string Stripped(std::string_view text)
{
    constexpr std::string_view kBlanks = " \t\r\n\v\f";
    const std::size_t first = text.find_first_not_of(kBlanks);
    if (first == std::string_view::npos) {
        return "";
    }
    return std::string(text.substr(first, text.find_last_not_of(kBlanks) - first + 1));
}

std::vector<LogicalLine> LogicalLinesOf(const std::string& text)
{
    std::vector<LogicalLine> lines;
    bool continues = false;
    for (std::size_t begin = 0; begin < text.size();) {
        const std::size_t end = std::min(text.find('\n', begin), text.size() - 1) + 1;
        const std::string raw = text.substr(begin, end - begin);
        begin = end;

        std::string content = raw;
        while (!content.empty() && (content.back() == '\n' || content.back() == '\r')) {
            content.pop_back();
        }
        if (!continues) {
            lines.emplace_back();
        }
        lines.back().raw += raw;
        const bool comment = !continues && Stripped(content).starts_with('#');
        continues = !comment && content.ends_with('\\');
        if (continues) {
            content.back() = ' ';
        }
        lines.back().text = Stripped(lines.back().text + content);
    }
    return lines;
}

bool IsClassWord(const std::string& word)
{
    return word == "auto" || word.starts_with("allow-");
}

/** Whether a line begins something new, so that it is no option of the paragraph before it. */
bool IsKeyword(const std::string& word)
{
    constexpr std::array<std::string_view, 8> kWords{
        "iface",        "mapping", "source",     "source-directory",
        "no-auto-down", "rename",  "no-scripts", "template"};
    return IsClassWord(word) || std::find(kWords.begin(), kWords.end(), word) != kWords.end();
}

class ConfigReader {
public:
    ConfigReader(const ReadText& readText, const FindFiles& findFiles)
        : m_readText(readText), m_findFiles(findFiles)
    {
    }

    InterfacesConfig Take(const std::string& path)
    {
        ReadFile(path);
        for (std::size_t index = 0; index < m_config.stanzas.size(); ++index) {
            Inherit(index);
        }
        return std::move(m_config);
    }

private:
    void ReadFile(const std::string& path)
    {
        // Files may include each other, and each of them several times.
        if (vornhost::Contains(m_config.paths, path)) {
            return;
        }
        m_config.paths.push_back(path);
        m_inInterface = false;
        for (const LogicalLine& line : LogicalLinesOf(m_readText(path))) {
            if (!line.IsEmpty()) {
                ReadLine(path, line.text);
            }
        }
    }

    void ReadLine(const std::string& path, const std::string& text)
    {
        std::vector<std::string> words = vornhost::Words(text);
        const std::string keyword = words.front();
        if (!IsKeyword(keyword)) {
            if (m_inInterface) {
                m_config.stanzas.back().options.emplace_back(keyword,
                                                             Stripped(text.substr(keyword.size())));
            }
            return;
        }
        m_inInterface = false;
        words.erase(words.begin());
        if (keyword == "iface" || keyword == "template") {
            BeginStanza(path, words);
            if (keyword == "template") {
                m_config.stanzas.back().method.clear(); // it configures none by itself
            }
        } else if (keyword == "mapping") {
            m_config.mapped.insert(words.begin(), words.end());
        } else if (keyword.starts_with("source")) {
            Include(path, keyword, words);
        } else if (IsClassWord(keyword)) {
            const std::string name = keyword == "auto" ? keyword : keyword.substr(6);
            for (const std::string& word : words) {
                m_config.classes[name].insert(word.substr(0, word.find('=')));
            }
        }
    }

    void BeginStanza(const std::string& path, const std::vector<std::string>& words)
    {
        InterfaceStanza stanza;
        stanza.path = path;
        std::vector<std::string> plain;
        std::vector<std::string> parents;
        bool inherits = false;
        for (const std::string& word : words) {
            if (word == "inherits") {
                inherits = true;
            } else {
                (inherits ? parents : plain).push_back(word);
            }
        }
        plain.resize(3);
        stanza.name = plain[0];
        stanza.family = plain[1];
        stanza.method = plain[2];
        m_config.stanzas.push_back(std::move(stanza));
        m_parents.push_back(std::move(parents));
        m_inInterface = true;
    }

    void Inherit(std::size_t index)
    {
        std::vector<std::pair<std::string, std::string>> inherited;
        for (const std::string& parent : m_parents[index]) {
            for (std::size_t other = 0; other < index; ++other) {
                const InterfaceStanza& stanza = m_config.stanzas[other];
                if (stanza.name == parent) {
                    inherited.insert(inherited.end(), stanza.options.begin(), stanza.options.end());
                }
            }
        }
        auto& options = m_config.stanzas[index].options;
        options.insert(options.begin(), inherited.begin(), inherited.end());
    }

    void Include(const std::string& path, const std::string& keyword,
                 const std::vector<std::string>& patterns)
    {
        for (std::string pattern : patterns) {
            if (!pattern.starts_with('/')) {
                pattern.insert(0, path.substr(0, path.rfind('/') + 1));
            }
            pattern += keyword == "source-directory" ? "/*" : "";
            for (const std::string& found : m_findFiles(pattern)) {
                const std::string name = found.substr(found.rfind('/') + 1);
                // A folder's files are only those whose names cannot be backups.
                const bool counts =
                    keyword == "source" ||
                    name.find_first_not_of("abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ"
                                           "0123456789_-") == std::string::npos;
                if (counts) {
                    ReadFile(std::filesystem::path(found).lexically_normal());
                }
            }
        }
        m_inInterface = false;
    }

    const ReadText& m_readText;
    const FindFiles& m_findFiles;
    InterfacesConfig m_config;
    std::vector<std::vector<std::string>> m_parents; // of each paragraph
    bool m_inInterface = false;
};

std::string EachLineAside(const std::string& raw)
{
    std::string aside;
    for (std::size_t begin = 0; begin < raw.size();) {
        const std::size_t end = std::min(raw.find('\n', begin), raw.size() - 1) + 1;
        aside += kAside;
        aside += raw.substr(begin, end - begin);
        begin = end;
    }
    return aside;
}

/** The line that names interfaces, without some of them. */
std::string NamesWithout(const LogicalLine& line, const std::set<std::string>& names)
{
    std::vector<std::string> words = vornhost::Words(line.text);
    const auto removed =
        std::remove_if(words.begin() + 1, words.end(), [&](const std::string& word) {
            return names.contains(word.substr(0, word.find('=')));
        });
    if (removed == words.end()) {
        return line.raw;
    }
    words.erase(removed, words.end());
    if (words.size() == 1) {
        return EachLineAside(line.raw);
    }
    std::string rest;
    for (const std::string& word : words) {
        rest += (rest.empty() ? "" : " ") + word;
    }
    // At its end it would have the next line go on with this one.
    rest += rest.ends_with('\\') ? " " : "";
    // On one line, whatever the original looks like: what is commented out has to be found again.
    std::string original = line.raw;
    const bool ends = original.ends_with('\n');
    if (std::count(original.begin(), original.end(), '\n') > 1 || !ends) {
        // The last line of a file may have no end, and then its replacement has none either.
        return EachLineAside(original) + (ends ? "" : "\n") + std::string(kReplaced) + "\n" + rest +
               (ends ? "\n" : "");
    }
    return std::string(kReplaced) + original + rest + '\n';
}

} // namespace

bool InterfacesConfig::Has(const std::string& interface) const
{
    return std::any_of(stanzas.begin(), stanzas.end(), [&](const InterfaceStanza& stanza) {
        return stanza.name == interface && !stanza.method.empty();
    });
}

bool InterfacesConfig::IsBroughtUp(const std::string& interface) const
{
    return std::any_of(classes.begin(), classes.end(),
                       [&](const auto& each) { return each.second.contains(interface); });
}

InterfacesConfig ReadInterfacesConfig(const std::string& path, const ReadText& readText,
                                      const FindFiles& findFiles)
{
    return ConfigReader(readText, findFiles).Take(path);
}

std::string WithoutInterfaces(const std::string& text, const std::set<std::string>& names)
{
    std::string result;
    bool aside = false;
    for (const LogicalLine& line : LogicalLinesOf(text)) {
        if (line.IsEmpty()) {
            result += line.raw;
            continue;
        }
        const std::vector<std::string> words = vornhost::Words(line.text);
        if (IsKeyword(words[0])) {
            aside = words[0] == "iface" && words.size() > 1 && names.contains(words[1]);
        }
        if (aside) {
            result += EachLineAside(line.raw);
        } else if (IsClassWord(words[0]) || words[0] == "no-auto-down" ||
                   words[0] == "no-scripts") {
            result += NamesWithout(line, names);
        } else {
            result += line.raw;
        }
    }
    return result;
}

std::string WithInterfacesAgain(const std::string& text)
{
    std::string result;
    bool replacement = false;
    for (std::size_t begin = 0; begin < text.size();) {
        const std::size_t end = std::min(text.find('\n', begin), text.size() - 1) + 1;
        const std::string line = text.substr(begin, end - begin);
        begin = end;
        if (replacement) {
            replacement = false;
            if (!line.ends_with('\n') && result.ends_with('\n')) {
                result.pop_back();
            }
        } else if (line.starts_with(kAside)) {
            result += line.substr(kAside.size());
        } else if (line.starts_with(kReplaced)) {
            const std::string original = line.substr(kReplaced.size());
            result += original == "\n" ? "" : original;
            replacement = true;
        } else {
            result += line;
        }
    }
    return result;
}

} // namespace vornovsctl
