/**
 * The configuration file of an interface, made of a wish.
 */
#ifndef VORNOVSCTL_ADOPT_WRITER_H
#define VORNOVSCTL_ADOPT_WRITER_H

#include "adopt/wish.h"

#include <string>
#include <vector>

namespace vornovsctl {

/** The path of an interface's file. */
std::string FilePathOf(const std::string& interface);

/** The whole text of the file. */
std::string FileTextOf(const Wish& wish);

/** @return what those who read the file would not take of it. */
std::vector<std::string> FaultsOf(const Wish& wish, const std::string& text);

} // namespace vornovsctl

#endif
