/**
 * What a reliability test counted, for those who want to know how much was tried.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_FIGURES_H
#define VORNOVS_TESTS_RELIABILITY_FIGURES_H

#include <string>

namespace reliability {

/**
 * Prints the line, and appends it to the file that VORNOVS_FIGURES names, if it does; several
 * programs may do so at once.
 */
void Figure(const std::string& line);

} // namespace reliability

#endif
