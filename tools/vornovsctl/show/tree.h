/**
 * Trees of text, drawn with lines.
 */
#ifndef VORNOVSCTL_SHOW_TREE_H
#define VORNOVSCTL_SHOW_TREE_H

#include "terminal.h"

#include <string>
#include <vector>

namespace vornovsctl {

enum class Tone { kPlain, kName, kGood, kBad };

/** A piece of a line that is not broken. */
struct Piece {
    std::string text;
    Tone tone = Tone::kPlain;
};

struct TreeNode {
    std::vector<Piece> pieces; /**< the line, with a blank between any two */
    std::vector<TreeNode> children;
};

/**
 * Draws a tree. Lines that are too long for the terminal go on below; control characters, and what
 * the terminal cannot show, are written as "\x" and two digits.
 */
std::string DrawTree(const TreeNode& root, const Terminal& terminal);

/** The text as it can be shown. @param unicode  whether well-formed UTF-8 can. */
std::string Printable(const std::string& text, bool unicode);

} // namespace vornovsctl

#endif
