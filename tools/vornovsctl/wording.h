/**
 * Pieces that many messages are made of.
 */
#ifndef VORNOVSCTL_WORDING_H
#define VORNOVSCTL_WORDING_H

#include <string>

namespace vornovsctl {

/** The name between quotes. */
inline std::string Quoted(const std::string& name)
{
    return '\'' + name + '\'';
}

/** The names with commas between them. */
template <typename Names>
std::string List(const Names& names)
{
    std::string text;
    for (const std::string& name : names) {
        text += (text.empty() ? "" : ", ") + name;
    }
    return text;
}

} // namespace vornovsctl

#endif
