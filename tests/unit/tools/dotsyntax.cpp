#include "dotsyntax.h"

#include <algorithm>
#include <cctype>
#include <stdexcept>

namespace unit {

namespace {

class Parser {
public:
    explicit Parser(const std::string& text) : m_text(text) {}

    // graph NAME { statement; ... }
    void Graph()
    {
        Sign("graph");
        Id();
        Sign("{");
        while (!Accept("}")) {
            Statement();
        }
        Blank();
        if (m_at != m_text.size()) {
            Fail("the end");
        }
    }

private:
    // ID [attributes]; or ID -- ID [attributes];
    void Statement()
    {
        Id();
        if (Accept("--")) {
            Id();
        }
        if (Accept("[")) {
            do {
                Id();
                Sign("=");
                Id();
            } while (Accept(","));
            Sign("]");
        }
        Sign(";");
    }

    void Id()
    {
        Blank();
        if (m_at < m_text.size() && m_text[m_at] == '"') {
            String();
            return;
        }
        const std::size_t begin = m_at;
        while (
            m_at < m_text.size() &&
            (std::isalnum(static_cast<unsigned char>(m_text[m_at])) != 0 || m_text[m_at] == '_')) {
            ++m_at;
        }
        if (m_at == begin) {
            Fail("a name");
        }
    }

    void String()
    {
        for (++m_at; m_at < m_text.size(); ++m_at) {
            if (m_text[m_at] == '\\') {
                ++m_at;
            } else if (m_text[m_at] == '"') {
                ++m_at;
                return;
            }
        }
        Fail("a closing quote");
    }

    void Sign(const std::string& sign)
    {
        if (!Accept(sign)) {
            Fail(sign);
        }
    }

    bool Accept(const std::string& sign)
    {
        Blank();
        if (m_text.compare(m_at, sign.size(), sign) != 0) {
            return false;
        }
        m_at += sign.size();
        return true;
    }

    void Blank()
    {
        while (m_at < m_text.size() &&
               std::isspace(static_cast<unsigned char>(m_text[m_at])) != 0) {
            ++m_at;
        }
    }

    [[noreturn]] void Fail(const std::string& wanted) const
    {
        throw std::runtime_error("at " + std::to_string(m_at) + ": " + wanted +
                                 " is wanted before " +
                                 m_text.substr(std::min(m_at, m_text.size()), 20));
    }

    const std::string& m_text;
    std::size_t m_at = 0;
};

} // namespace

std::string DotFault(const std::string& text)
{
    try {
        Parser(text).Graph();
    } catch (const std::runtime_error& error) {
        return error.what();
    }
    return "";
}

} // namespace unit
