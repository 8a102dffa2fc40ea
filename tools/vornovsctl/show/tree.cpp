#include "show/tree.h"

#include <string_view>

namespace vornovsctl {

namespace {

struct Strokes {
    const char* branch;
    const char* last;
    const char* pass;
    const char* none;
};

constexpr Strokes kBoxes{"\u251c\u2500 ", "\u2514\u2500 ", "\u2502  ", "   "};
constexpr Strokes kAscii{"|- ", "`- ", "|  ", "   "};
constexpr std::size_t kStrokeWidth = 3;
constexpr std::size_t kHanging = 4; // what goes on in the next line stands that much further in

bool IsContinuation(unsigned char byte)
{
    return (byte & 0xc0U) == 0x80;
}

// Size of the well-formed character that begins there; 0: none does.
std::size_t CharacterSize(std::string_view text)
{
    const auto first = static_cast<unsigned char>(text.front());
    if (first < 0x80) {
        return 1;
    }
    std::size_t size = 0;
    if (first >= 0xc2 && first < 0xe0) {
        size = 2;
    } else if (first >= 0xe0 && first < 0xf0) {
        size = 3;
    } else if (first >= 0xf0 && first < 0xf5) {
        size = 4;
    }
    if (size == 0 || text.size() < size) {
        return 0;
    }
    for (std::size_t index = 1; index < size; ++index) {
        if (!IsContinuation(static_cast<unsigned char>(text[index]))) {
            return 0;
        }
    }
    const auto second = static_cast<unsigned char>(text[1]);
    // Overlong forms, surrogates and what lies beyond the last character.
    const bool outside = (first == 0xe0 && second < 0xa0) || (first == 0xed && second > 0x9f) ||
                         (first == 0xf0 && second < 0x90) || (first == 0xf4 && second > 0x8f);
    // The control characters above ASCII move the cursor as well.
    const bool control = first == 0xc2 && second < 0xa0;
    return outside || control ? 0 : size;
}

std::string HexEscape(char character)
{
    constexpr char kDigits[] = "0123456789abcdef";
    const auto byte = static_cast<unsigned char>(character);
    return {'\\', 'x', kDigits[byte >> 4U], kDigits[byte & 0xfU]};
}

std::size_t Columns(const std::string& text)
{
    std::size_t columns = 0;
    for (const char character : text) {
        columns += IsContinuation(static_cast<unsigned char>(character)) ? 0U : 1U;
    }
    return columns;
}

std::string Coloured(const std::string& text, Tone tone)
{
    switch (tone) {
    case Tone::kName:
        return "\x1b[1m" + text + "\x1b[0m";
    case Tone::kGood:
        return "\x1b[32m" + text + "\x1b[0m";
    case Tone::kBad:
        return "\x1b[31m" + text + "\x1b[0m";
    case Tone::kPlain:
        break;
    }
    return text;
}

class Drawing {
public:
    explicit Drawing(const Terminal& terminal)
        : m_terminal(terminal), m_strokes(terminal.unicode ? kBoxes : kAscii)
    {
    }

    /** @param lead  strokes before the line; further: those before what belongs to it. */
    void Add(const TreeNode& node, const std::string& lead, const std::string& further)
    {
        AddLine(node, lead, further + (node.children.empty() ? m_strokes.none : m_strokes.pass));
        for (std::size_t index = 0; index < node.children.size(); ++index) {
            const bool last = index + 1 == node.children.size();
            Add(node.children[index], further + (last ? m_strokes.last : m_strokes.branch),
                further + (last ? m_strokes.none : m_strokes.pass));
        }
    }

    const std::string& Text() const { return m_text; }

private:
    void AddLine(const TreeNode& node, const std::string& lead, const std::string& hang)
    {
        m_text += lead;
        std::size_t column = Columns(lead);
        bool first = true;
        for (const Piece& piece : node.pieces) {
            const std::string text = Printable(piece.text, m_terminal.unicode);
            const std::size_t width = Columns(text);
            if (!first && m_terminal.width > 0 && column + 1 + width > m_terminal.width) {
                m_text += '\n' + hang + std::string(kHanging - kStrokeWidth, ' ');
                column = Columns(hang) + kHanging - kStrokeWidth;
            } else if (!first) {
                m_text += ' ';
                ++column;
            }
            m_text += m_terminal.colour ? Coloured(text, piece.tone) : text;
            column += width;
            first = false;
        }
        m_text += '\n';
    }

    const Terminal& m_terminal;
    const Strokes& m_strokes;
    std::string m_text;
};

} // namespace

std::string DrawTree(const TreeNode& root, const Terminal& terminal)
{
    Drawing drawing(terminal);
    drawing.Add(root, "", "");
    return drawing.Text();
}

std::string Printable(const std::string& text, bool unicode)
{
    std::string shown;
    std::string_view rest = text;
    while (!rest.empty()) {
        const auto byte = static_cast<unsigned char>(rest.front());
        std::size_t size = byte < 0x20 || byte == 0x7f ? 0 : CharacterSize(rest);
        if (size > 1 && !unicode) {
            size = 0;
        }
        shown += size == 0 ? HexEscape(rest.front()) : std::string(rest.substr(0, size));
        rest.remove_prefix(size == 0 ? 1 : size);
    }
    return shown;
}

} // namespace vornovsctl
