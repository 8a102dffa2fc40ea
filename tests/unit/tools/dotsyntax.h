/**
 * Judges the text of an undirected graph by Graphviz's grammar, as far as this project uses it.
 */
#ifndef VORNOVS_TESTS_UNIT_TOOLS_DOTSYNTAX_H
#define VORNOVS_TESTS_UNIT_TOOLS_DOTSYNTAX_H

#include <string>

namespace unit {

/** @return where the text is wrong and what was wanted there; empty: it is right. */
std::string DotFault(const std::string& text);

} // namespace unit

#endif
